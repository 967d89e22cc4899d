#ifndef LOG_LINEWRITER_H
#define LOG_LINEWRITER_H

#include "Line.h"

#include <atomic>

namespace OrvLog {

/** Writes lines to a descriptor, each with one write(2) so that lines of several writers do not mix. */
class LineWriter {
public:
    /**
     * Writes a line. No signal is raised if the reader is gone (EPIPE) or the limit for file sizes is reached (EFBIG):
     * these are errors like others.
     *
     * @return 0, or the error number that says why the line is lost.
     */
    int write(int descriptor, const Line& line);

private:
    /** Whether the last line was written only in part; then the next one begins with a line feed. */
    std::atomic<bool> _torn = false;
};

} // namespace OrvLog

#endif

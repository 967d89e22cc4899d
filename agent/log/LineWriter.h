#ifndef LOG_LINEWRITER_H
#define LOG_LINEWRITER_H

#include "Line.h"

#include <atomic>

namespace OrvLog {

/** Writes lines to a descriptor, each with one write(2) so that lines of several writers do not mix. */
class LineWriter {
public:
    /**
     * Writes a line. No signal is raised: a reader that is gone and a size limit that is reached are errors like
     * others.
     *
     * @return 0, or the error number that says why the line is lost.
     */
    int write(int descriptor, const Line& line);

private:
    /** The last line was written in part only, so that the next one begins on a line of its own. */
    std::atomic<bool> _torn = false;
};

} // namespace OrvLog

#endif

/**
 * The text of one log record, built by streaming: liborvlog.so.1.
 */
#ifndef ORVLOG_ORVMESSAGEBUFFER_H
#define ORVLOG_ORVMESSAGEBUFFER_H

#include <ostream>
#include <string>

namespace OrvLog {

/**
 * A text stream whose text is handed over record by record. A buffer belongs to one thread at a time.
 *
 * The object is one word: the library that implements it can be exchanged without rebuilding its users.
 */
class OrvMessageBuffer {
public:
    OrvMessageBuffer();
    ~OrvMessageBuffer();
    OrvMessageBuffer(const OrvMessageBuffer&) = delete;
    OrvMessageBuffer& operator=(const OrvMessageBuffer&) = delete;

    /** Appends a text. A null pointer makes the stream bad until the next hand-over. */
    OrvMessageBuffer& operator<<(const char* text);

    /** The buffer as a standard stream, for numbers, pointers and std::string values. Lives as long as the buffer. */
    operator std::ostream&();

    /**
     * Hands over what has been streamed since the last hand-over and leaves the buffer empty, and good again, for the
     * next text.
     *
     * @return the text, valid until the next hand-over of the same buffer or its end.
     */
    static const std::string& str(OrvMessageBuffer& buffer);

    /** The same for a stream that `operator std::ostream&` gave. */
    static const std::string& str(std::ostream& stream);

private:
    class Implementation;
    Implementation* _implementation;
};

/** Streams the pointer's value. */
template <typename T>
inline std::ostream& operator<<(OrvMessageBuffer& buffer, const T* pointer) {
    return static_cast<std::ostream&>(buffer) << static_cast<const void*>(pointer);
}

} // namespace OrvLog

#endif

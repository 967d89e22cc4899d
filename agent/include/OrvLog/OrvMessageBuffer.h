/**
 * Builds the text of a log record by streaming: liborvlog.so.1.
 */
#ifndef ORVLOG_ORVMESSAGEBUFFER_H
#define ORVLOG_ORVMESSAGEBUFFER_H

#include <ostream>
#include <string>

namespace OrvLog {

/**
 * A text stream whose text is handed over record by record. Only one thread at a time may use a buffer.
 *
 * The object is one word, so that the library can be replaced without rebuilding its users.
 */
class OrvMessageBuffer {
public:
    OrvMessageBuffer();
    ~OrvMessageBuffer();
    OrvMessageBuffer(const OrvMessageBuffer&) = delete;
    OrvMessageBuffer& operator=(const OrvMessageBuffer&) = delete;

    /** Appends a text. A null pointer makes the stream bad until the next call of `str`. */
    OrvMessageBuffer& operator<<(const char* text);

    /** The buffer as a standard stream, for numbers, pointers and std::string values; valid as long as the buffer. */
    operator std::ostream&();

    /**
     * Hands over the text that has been streamed since the last call, and leaves the buffer empty, and its stream good,
     * for the next text.
     *
     * @return the text, valid until the next call with the same buffer, or until the buffer is destroyed.
     */
    static const std::string& str(OrvMessageBuffer& buffer);

    /** The same for a stream that `operator std::ostream&` returned. */
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

#include "OrvLog/OrvLogger.h"
#include "OrvLog/OrvMessageBuffer.h"

#include "Agent.h"
#include "Transcript.h"

#include <sstream>

namespace OrvLog {

using OrvTest::Agent;
using OrvTest::LogRecord;
using OrvTest::Transcript;

class OrvMessageBuffer::Implementation : public std::ostringstream {
public:
    const std::string& handOver() {
        _text = std::ostringstream::str();
        std::ostringstream::str({});
        clear();
        return _text;
    }

private:
    std::string _text;
};

OrvMessageBuffer::OrvMessageBuffer() {
    Agent::instance().faults.next("OrvMessageBuffer");
    Transcript::instance().reading("OrvMessageBuffer()");
    _implementation = new Implementation;
    ++Agent::instance().messageBuffers;
}

OrvMessageBuffer::~OrvMessageBuffer() {
    Transcript::instance().reading("~OrvMessageBuffer()");
    --Agent::instance().messageBuffers;
    delete _implementation;
}

OrvMessageBuffer& OrvMessageBuffer::operator<<(const char* text) {
    Transcript::instance().reading(std::string("OrvMessageBuffer << ") + (text == nullptr ? "null" : text));
    static_cast<std::ostream&>(*_implementation) << text;
    return *this;
}

OrvMessageBuffer::operator std::ostream&() {
    return *_implementation;
}

const std::string& OrvMessageBuffer::str(OrvMessageBuffer& buffer) {
    return buffer._implementation->handOver();
}

const std::string& OrvMessageBuffer::str(std::ostream& stream) {
    return dynamic_cast<Implementation&>(stream).handOver();
}

namespace {

void record(LogRecord::Kind kind, const char* function, const char* file, int line, const std::string& category,
            int level, bool usualArguments, const std::string& message) {
    const auto text = [](const char* value) { return std::string(value == nullptr ? "null" : value); };
    Agent::instance().faults.next(kind == LogRecord::Kind::log ? "logLevelMessage" : "traceLevelMessage");
    Transcript::instance().record({kind, level, category, text(function), text(file), line, message, usualArguments});
}

} // namespace

void OrvLogger::logLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                int level, char* first, int second, int third, const std::string& message) {
    record(LogRecord::Kind::log, function, file, line, category, level, first == nullptr && second == 0 && third == 0,
           message);
}

void OrvLogger::traceLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                  int level, char* first, int second, int third, const std::string& message) {
    record(LogRecord::Kind::trace, function, file, line, category, level, first == nullptr && second == 0 && third == 0,
           message);
}

} // namespace OrvLog

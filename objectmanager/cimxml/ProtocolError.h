/** How a request fails before it is known to be a CIM operation. */
#ifndef CIMXML_PROTOCOLERROR_H
#define CIMXML_PROTOCOLERROR_H

#include "server/HttpStatus.h"

#include <stdexcept>
#include <string>

namespace ObjectManager::CimXml {

/** A request that is refused by its HTTP status; what() is one line for the person who asked. */
class ProtocolError : public std::runtime_error {
public:
    /** `cimError` is the value of the reply's header CIMError, a literal; null where it has none. */
    ProtocolError(unsigned int status, const char* cimError, const std::string& message)
        : std::runtime_error(message), _status(status), _cimError(cimError) {}

    unsigned int status() const { return _status; }
    const char* cimError() const { return _cimError; }

private:
    unsigned int _status;
    const char* _cimError;
};

namespace Http = Server::Status;

/** The body is no XML. */
inline ProtocolError notWellFormed(const std::string& message) {
    return {Http::badRequest, "request-not-well-formed", message};
}

/** The body is XML, but lacks what the document type demands. What is there beyond that is not minded. */
inline ProtocolError notLooselyValid(const std::string& message) {
    return {Http::badRequest, "request-not-loosely-valid", message};
}

/** A header says something else than the body. */
inline ProtocolError headerMismatch(const std::string& message) {
    return {Http::badRequest, "header-mismatch", message};
}

} // namespace ObjectManager::CimXml

#endif

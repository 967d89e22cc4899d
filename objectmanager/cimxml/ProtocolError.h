/** Errors of requests that are not CIM operations. */
#ifndef CIMXML_PROTOCOLERROR_H
#define CIMXML_PROTOCOLERROR_H

#include "server/HttpStatus.h"

#include <stdexcept>
#include <string>

namespace ObjectManager::CimXml {

/** A request that is refused with an HTTP status. what() is one line for the client's user. */
class ProtocolError : public std::runtime_error {
public:
    /** @param cimError the value of the reply's header CIMError, a literal; null if the reply does not have it. */
    ProtocolError(unsigned int status, const char* cimError, const std::string& message)
        : std::runtime_error(message), _status(status), _cimError(cimError) {}

    unsigned int status() const { return _status; }
    const char* cimError() const { return _cimError; }

private:
    unsigned int _status;
    const char* _cimError;
};

namespace Http = Server::Status;

/** The body is not well-formed XML. */
inline ProtocolError notWellFormed(const std::string& message) {
    return {Http::badRequest, "request-not-well-formed", message};
}

/**
 * The body is XML, but lacks something that the document type requires. Anything that it has beyond that is ignored.
 */
inline ProtocolError notLooselyValid(const std::string& message) {
    return {Http::badRequest, "request-not-loosely-valid", message};
}

/** A header contradicts the body. */
inline ProtocolError headerMismatch(const std::string& message) {
    return {Http::badRequest, "header-mismatch", message};
}

} // namespace ObjectManager::CimXml

#endif

/** The error of a server that cannot be started. */
#ifndef SERVER_SERVERERROR_H
#define SERVER_SERVERERROR_H

#include <stdexcept>

namespace ObjectManager::Server {

/** A server that cannot be started. what() is one line. */
class ServerError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

} // namespace ObjectManager::Server

#endif

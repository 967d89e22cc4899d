#include "Destination.h"
#include "LineWriter.h"

#include <poll.h>
#include <unistd.h>

#include <cerrno>

namespace OrvLog {

namespace {

class StandardErrorDestination final : public Destination {
public:
    std::string name() const override { return "standard error"; }

    int write(const Line& line) override {
        // O_NONBLOCK would change the open file for all processes that share it, so the log asks before it writes.
        pollfd standardError{.fd = STDERR_FILENO, .events = POLLOUT, .revents = 0};
        if (poll(&standardError, 1, 0) == 0) {
            return EAGAIN;
        }
        return _writer.write(STDERR_FILENO, line);
    }

private:
    LineWriter _writer;
};

} // namespace

std::unique_ptr<Destination> standardErrorDestination() {
    return std::make_unique<StandardErrorDestination>();
}

} // namespace OrvLog

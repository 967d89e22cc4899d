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
        // Whether a write waits is a property of the open file, which is not the log's to change.
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

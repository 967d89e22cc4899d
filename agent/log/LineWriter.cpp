#include "LineWriter.h"

#include <sys/uio.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <ctime>
#include <string_view>

namespace OrvLog {

namespace {

// Keeps the signals that a failing write(2) raises away from the host, which they could terminate.
class WithoutWriteSignals {
public:
    WithoutWriteSignals() {
        sigemptyset(&_signals);
        sigaddset(&_signals, SIGPIPE);
        sigaddset(&_signals, SIGXFSZ);
        pthread_sigmask(SIG_BLOCK, &_signals, &_before);
        // Only a signal that the host blocks can be pending.
        sigemptyset(&_pendingBefore);
        if (sigismember(&_before, SIGPIPE) != 0 || sigismember(&_before, SIGXFSZ) != 0) {
            sigpending(&_pendingBefore);
        }
    }

    ~WithoutWriteSignals() { pthread_sigmask(SIG_SETMASK, &_before, nullptr); }

    WithoutWriteSignals(const WithoutWriteSignals&) = delete;
    WithoutWriteSignals& operator=(const WithoutWriteSignals&) = delete;

    /**
     * Removes the pending signal that this thread's write has just raised, unless it was pending before: then the host
     * expects it.
     */
    void takeBack(int signal) const {
        if (sigismember(&_pendingBefore, signal) == 0) {
            sigset_t raised;
            sigemptyset(&raised);
            sigaddset(&raised, signal);
            const timespec atOnce{};
            sigtimedwait(&raised, nullptr, &atOnce);
        }
    }

private:
    sigset_t _signals{};
    sigset_t _before{};
    sigset_t _pendingBefore{};
};

iovec piece(std::string_view text) {
    // writev(2) does not change the text, but shares its argument type with readv(2).
    return {.iov_base = const_cast<char*>(text.data()), .iov_len = text.size()};
}

} // namespace

int LineWriter::write(int descriptor, const Line& line) {
    const bool torn = _torn.exchange(false);
    const std::array pieces{piece(torn ? "\n" : ""), piece(line.whole())};
    const std::size_t size = pieces[0].iov_len + pieces[1].iov_len;

    const WithoutWriteSignals quiet;
    const ssize_t written = TEMP_FAILURE_RETRY(::writev(descriptor, pieces.data(), pieces.size()));
    if (written >= 0) {
        _torn = static_cast<std::size_t>(written) < size;
        return _torn ? ENOSPC : 0;
    }
    const int error = errno;
    if (error == EPIPE) {
        quiet.takeBack(SIGPIPE);
    } else if (error == EFBIG) {
        quiet.takeBack(SIGXFSZ);
    }
    _torn = torn;
    return error;
}

} // namespace OrvLog

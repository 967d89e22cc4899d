#include "Hanging.h"

#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <unistd.h>

#include <atomic>

namespace {

std::atomic<bool> hanging = false;
std::atomic<int> writes = 0;

} // namespace

void LogTest::hangFiles(bool hang) {
    hanging = hang;
    hanging.notify_all();
}

int LogTest::hangingWrites() {
    return writes;
}

// This replaces the C library's writev for the library, too.
extern "C" ssize_t writev(int descriptor, const iovec* pieces, int count) {
    struct stat status {};
    if (hanging && fstat(descriptor, &status) == 0 && S_ISREG(status.st_mode)) {
        ++writes;
        hanging.wait(true);
        --writes;
    }
    return syscall(SYS_writev, descriptor, pieces, count);
}

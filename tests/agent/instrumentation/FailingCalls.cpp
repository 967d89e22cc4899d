#include "FailingCalls.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

#include <dlfcn.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

/** A literal; null if no call fails. It has no destructor, since a thread may write until it has ended. */
constinit thread_local const char* failing = nullptr;
constinit thread_local int failure = 0;

/** Whether this call fails; the next one then does not. */
bool fails(const char* call) {
    if (failing == nullptr || std::strcmp(failing, call) != 0) {
        return false;
    }
    failing = nullptr;
    errno = failure;
    return true;
}

/** The C library's own function. */
template <typename Function>
Function* real(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

} // namespace

namespace AgentTest {

void failNext(const char* call, int error) {
    failing = call;
    failure = error;
}

bool hasFailed() {
    return failing == nullptr;
}

} // namespace AgentTest

// These replace the C library's functions for the code under test.
extern "C" {

ssize_t write(int descriptor, const void* data, size_t size) {
    static auto* const original = real<decltype(write)>("write");
    if (fails("write")) {
        return failure == 0 ? 0 : -1;
    }
    return original(descriptor, data, size);
}

int fsync(int descriptor) {
    static auto* const original = real<decltype(fsync)>("fsync");
    return fails("fsync") ? -1 : original(descriptor);
}

int futimens(int descriptor, const timespec times[2]) noexcept {
    static auto* const original = real<int(int, const timespec*)>("futimens");
    return fails("futimens") ? -1 : original(descriptor, times);
}

int rename(const char* from, const char* to) noexcept {
    static auto* const original = real<int(const char*, const char*)>("rename");
    return fails("rename") ? -1 : original(from, to);
}
}

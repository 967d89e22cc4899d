#include "Patience.h"

#include <algorithm>

namespace Norv::Agent {

namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

/** Of the whole time, what an operation may take and still count as quick. */
constexpr int quickFraction = 5;
/** A pause after which a thread is taken to answer another request. */
constexpr std::chrono::seconds pause{1};

/** What the thread's slow operations took, one after the other, and when the last one ended. */
struct Account {
    milliseconds spent{0};
    steady_clock::time_point end;
};

constinit thread_local Account account;

milliseconds left(milliseconds whole) {
    if (steady_clock::now() - account.end > pause) {
        account.spent = milliseconds{0};
    }
    return std::max(whole - account.spent, milliseconds{0});
}

} // namespace

Patience::Patience(milliseconds whole) : _deadline(whole, left(whole)) {}

Patience::~Patience() {
    const auto now = steady_clock::now();
    const auto taken = std::chrono::ceil<milliseconds>(now - _begin);
    if (account.spent >= _deadline.whole()) {
        return; // The pause begins with the operation that used the time up, not with those that had none left.
    }
    account.spent = taken * quickFraction > _deadline.whole() ? account.spent + taken : milliseconds{0};
    account.end = now;
}

} // namespace Norv::Agent

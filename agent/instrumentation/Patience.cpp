#include "Patience.h"

#include <algorithm>

namespace Norv::Agent {

namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

/** An operation that takes at most the whole time divided by this counts as quick. */
constexpr int quickFraction = 5;
/** After a pause this long, the thread is assumed to serve another request. */
constexpr std::chrono::seconds pause{1};

/** The total time of the thread's latest slow operations, and when the last of them ended. */
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
        return; // The pause begins after the operation that used the time up; later ones do not prolong it.
    }
    account.spent = taken * quickFraction > _deadline.whole() ? account.spent + taken : milliseconds{0};
    account.end = now;
}

} // namespace Norv::Agent

#ifndef BASE_DESCRIPTOR_H
#define BASE_DESCRIPTOR_H

#include <unistd.h>

#include <utility>

namespace Norv::Agent {

/** A file descriptor that is closed when the object is destroyed. */
class Descriptor {
public:
    /** @param number the result of open(2), -1 included; errno is not changed. */
    explicit Descriptor(int number) : _number(number) {}
    ~Descriptor() {
        if (isOpen()) {
            ::close(_number);
        }
    }
    Descriptor(Descriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(_number, other._number);
        return *this;
    }
    Descriptor& operator=(const Descriptor&) = delete;

    bool isOpen() const { return _number >= 0; }
    int number() const { return _number; }

private:
    int _number;
};

} // namespace Norv::Agent

#endif

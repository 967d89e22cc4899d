#include "OrvLog/OrvMessageBuffer.h"

#include <array>
#include <atomic>
#include <cstddef>
#include <ios>
#include <locale>
#include <memory>
#include <ostream>
#include <streambuf>
#include <string>
#include <utility>

namespace OrvLog {

namespace {

// Collects streamed text. Handing a text over swaps two strings, so that both keep their memory.
class Texts final : public std::streambuf {
public:
    const std::string& handOver() {
        _handedOver.clear();
        std::swap(_handedOver, _collected);
        return _handedOver;
    }

    void clear() { _collected.clear(); }

    std::size_t capacity() const { return _collected.capacity() + _handedOver.capacity(); }

protected:
    int_type overflow(int_type character) override {
        if (!traits_type::eq_int_type(character, traits_type::eof())) {
            _collected.push_back(traits_type::to_char_type(character));
        }
        return traits_type::not_eof(character);
    }

    std::streamsize xsputn(const char* text, std::streamsize size) override {
        _collected.append(text, static_cast<std::size_t>(size));
        return size;
    }

private:
    std::string _collected;
    std::string _handedOver;
};

// Objects that are kept for their next user. A record needs its buffer only for a moment, so the pool holds about as
// many objects as threads log at the same time. It has no lock, which another thread could hold while the host forks.
template <typename T>
class Pool {
public:
    /** Takes an object out of the pool; null if the pool is empty. */
    std::unique_ptr<T> take() {
        for (auto& place : _places) {
            if (place.load(std::memory_order_relaxed) != nullptr) {
                if (T* object = place.exchange(nullptr, std::memory_order_acquire)) {
                    return std::unique_ptr<T>(object);
                }
            }
        }
        return nullptr;
    }

    void put(std::unique_ptr<T> object) {
        for (auto& place : _places) {
            T* none = nullptr;
            if (place.load(std::memory_order_relaxed) == nullptr &&
                place.compare_exchange_strong(none, object.get(), std::memory_order_release,
                                              std::memory_order_relaxed)) {
                static_cast<void>(object.release());
                return;
            }
        }
    }

private:
    std::array<std::atomic<T*>, 16> _places{};
};

} // namespace

class OrvMessageBuffer::Implementation final : public std::ostream {
public:
    static Implementation* make() {
        auto buffer = _pool.take();
        if (!buffer) {
            buffer = std::make_unique<Implementation>();
        }
        buffer->renew();
        return buffer.release();
    }

    static void giveBack(Implementation* implementation) {
        std::unique_ptr<Implementation> buffer(implementation);
        constexpr std::size_t largestKept = 64UL * 1024;
        if (buffer->_texts.capacity() <= largestKept) {
            _pool.put(std::move(buffer));
        }
    }

    Implementation() : std::ostream(nullptr) {}

    const std::string& handOver() {
        clear();
        return _texts.handOver();
    }

private:
    // Resets everything that the former user has set, and any locale taken over from the host program's global one.
    void renew() {
        rdbuf(&_texts);
        exceptions(goodbit);
        flags(skipws | dec);
        precision(6);
        width(0);
        fill(' ');
        if (getloc() != std::locale::classic()) {
            imbue(std::locale::classic());
        }
        _texts.clear();
    }

    static constinit inline Pool<Implementation> _pool;
    Texts _texts;
};

OrvMessageBuffer::OrvMessageBuffer() : _implementation(Implementation::make()) {}

OrvMessageBuffer::~OrvMessageBuffer() {
    Implementation::giveBack(_implementation);
}

OrvMessageBuffer& OrvMessageBuffer::operator<<(const char* text) {
    static_cast<std::ostream&>(*_implementation) << text;
    return *this;
}

OrvMessageBuffer::operator std::ostream&() {
    return *_implementation;
}

const std::string& OrvMessageBuffer::str(OrvMessageBuffer& buffer) {
    return buffer._implementation->handOver();
}

const std::string& OrvMessageBuffer::str(std::ostream& stream) {
    if (auto* implementation = dynamic_cast<Implementation*>(&stream)) {
        return implementation->handOver();
    }
    static const std::string noText;
    return noText;
}

} // namespace OrvLog

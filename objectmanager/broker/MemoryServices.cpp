/* Providers get memory of the current request here, and release objects before the request ends. */
#include "broker/Objects.h"

namespace ObjectManager {

namespace {

/** Stands in front of each block that a provider gets, since a provider that frees the block does not tell its size. */
struct alignas(std::max_align_t) BlockHead {
    std::size_t bytes;
};

/** The greatest size of a block. A provider that asks for a greater one has miscalculated. */
constexpr std::size_t maximumBlock = std::size_t{1} << 30U;

BlockHead* headOf(void* block) {
    return static_cast<BlockHead*>(block) - 1;
}

/** The mark of a request in which no object was made yet. Every other mark is the address of the newest object. */
char emptyMark;

CMPIGcStat* mark(const CMPIBroker* broker, CMPIStatus* rc) {
    Request* request = broker != nullptr ? requestFor(rc) : nullptr;
    if (request == nullptr) {
        return failure(rc, broker != nullptr ? CMPI_RC_ERR_FAILED : CMPI_RC_ERR_INVALID_HANDLE);
    }
    return request->newest() != nullptr ? static_cast<void*>(request->newest()) : &emptyMark;
}

/** Releases the objects that were made since the mark and are not released yet. */
CMPIStatus releaseMark(const CMPIBroker* broker, const CMPIGcStat* mark) {
    CMPIStatus status;
    const Request* request = requestFor(&status);
    if (broker == nullptr || mark == nullptr || request == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    ObjectHeader* const last = mark == &emptyMark ? nullptr : static_cast<ObjectHeader*>(const_cast<void*>(mark));
    ObjectHeader* object = request->newest();
    while (object != nullptr && object != last) {
        object = object->previous;
    }
    if (object != last) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    for (object = request->newest(); object != last; object = object->previous) {
        visitObject(object, [&]<typename Handle>(const Handle*) {
            if (object->hdl != nullptr) {
                dropContent<Handle>(*object);
            }
        });
    }
    return status;
}

void* cmpiMalloc(const CMPIBroker* broker, std::size_t bytes) {
    Request* request = Request::current();
    if (broker == nullptr || request == nullptr || bytes > maximumBlock) {
        return nullptr;
    }
    try {
        void* block = request->memory().allocate(sizeof(BlockHead) + bytes, alignof(BlockHead));
        return new (block) BlockHead{bytes} + 1;
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

void* cmpiCalloc(const CMPIBroker* broker, std::size_t count, std::size_t size) {
    std::size_t bytes = 0;
    void* block = __builtin_mul_overflow(count, size, &bytes) ? nullptr : cmpiMalloc(broker, bytes);
    return block != nullptr ? std::memset(block, 0, bytes) : nullptr;
}

void cmpiFree(const CMPIBroker* broker, void* block) {
    Request* request = Request::current();
    if (broker != nullptr && request != nullptr && block != nullptr) {
        BlockHead* head = headOf(block);
        request->memory().deallocate(head, sizeof(BlockHead) + head->bytes, alignof(BlockHead));
    }
}

void* cmpiRealloc(const CMPIBroker* broker, void* block, std::size_t bytes) {
    void* moved = cmpiMalloc(broker, bytes);
    if (moved != nullptr && block != nullptr) {
        std::memcpy(moved, block, std::min(bytes, headOf(block)->bytes));
        cmpiFree(broker, block);
    }
    return moved;
}

char* cmpiStrDup(const CMPIBroker* broker, const char* text) {
    if (text == nullptr) {
        return nullptr;
    }
    const std::size_t bytes = std::strlen(text) + 1;
    void* copy = cmpiMalloc(broker, bytes);
    return copy != nullptr ? static_cast<char*>(std::memcpy(copy, text, bytes)) : nullptr;
}

template <typename Handle>
void freeObject(const CMPIBroker*, Handle* object) {
    release(object);
}

/** Does nothing, since no CMPISelectExp can be made (`newSelectExp`). */
void freeSelectExp(const CMPIBroker*, CMPISelectExp*) {}

} // namespace

const CMPIBrokerMemFT memoryTable = {
    CMPIVersion200,
    mark,
    releaseMark,
    cmpiMalloc,
    cmpiCalloc,
    cmpiRealloc,
    cmpiStrDup,
    cmpiFree,
    freeObject<CMPIInstance>,
    freeObject<CMPIObjectPath>,
    freeObject<CMPIArgs>,
    freeObject<CMPIString>,
    freeObject<CMPIArray>,
    freeObject<CMPIDateTime>,
    freeSelectExp,
};

} // namespace ObjectManager

/** Shows in which memory values lie. */
#ifndef TESTS_OBJECTMANAGER_MODEL_NOOTHERMEMORY_H
#define TESTS_OBJECTMANAGER_MODEL_NOOTHERMEMORY_H

#include <memory_resource>

namespace ObjectManager {

/** While it lives, values take memory only from what an allocator names: where none is named, std::bad_alloc is thrown.
 */
class NoOtherMemory {
public:
    NoOtherMemory() : _before(std::pmr::set_default_resource(std::pmr::null_memory_resource())) {}
    NoOtherMemory(const NoOtherMemory&) = delete;
    NoOtherMemory& operator=(const NoOtherMemory&) = delete;
    ~NoOtherMemory() { std::pmr::set_default_resource(_before); }

private:
    std::pmr::memory_resource* _before;
};

} // namespace ObjectManager

#endif

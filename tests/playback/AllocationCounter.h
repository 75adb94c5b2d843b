#pragma once

#include <cstdint>

namespace glimmet::test {

/// Counts the allocations through operator new made by the calling thread
/// while it lives. The test program replaces the global operator new for it.
class AllocationCounter {
public:
    AllocationCounter();
    ~AllocationCounter();
    int64_t Count() const;
};

}  // namespace glimmet::test

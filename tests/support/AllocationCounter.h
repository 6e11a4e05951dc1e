// Counts the global operator new calls made on any thread while an AllocationCounter is alive. Link
// AllocationCounter.cpp into a test binary to replace the global operator new and delete with counting
// versions; outside a counter's lifetime they only forward to malloc and free.
#pragma once

namespace ulvetta {

class AllocationCounter {
public:
    AllocationCounter();  // starts counting from zero
    ~AllocationCounter();
    AllocationCounter(const AllocationCounter&) = delete;
    AllocationCounter& operator=(const AllocationCounter&) = delete;

    long count() const;
};

}  // namespace ulvetta

/**
 * @file
 * Memory that runs short at a chosen moment.
 */
#pragma once

namespace TestSupport {

/**
 * Lets allocations by `new` fail on the calling thread while it lives. Programs that use it replace
 * the global operators: compile support/AllocationFault.cpp into them.
 */
class AllocationFault {
  public:
    enum Extent { ONE, ALL_FROM_THERE_ON };

    /** @param number the first allocation that fails, from 1 */
    AllocationFault(int number, Extent extent);
    ~AllocationFault();
    AllocationFault(const AllocationFault&) = delete;
    AllocationFault& operator=(const AllocationFault&) = delete;

    /** Whether an allocation has failed. */
    static bool hasHappened();
};

}  // namespace TestSupport

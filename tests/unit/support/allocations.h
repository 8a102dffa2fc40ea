/**
 * Has memory run out in programs that are linked with this.
 */
#ifndef VORNOVS_TESTS_UNIT_ALLOCATIONS_H
#define VORNOVS_TESTS_UNIT_ALLOCATIONS_H

namespace unit {

/** An allocation that fails while this lives: one of the program's, none of the harness's. */
class FailingAllocation {
public:
    /** @param nth  which one fails, counted from 1; `allThatFollow`: so do those after it. */
    FailingAllocation(long nth, bool allThatFollow);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation&) = delete;
    FailingAllocation& operator=(const FailingAllocation&) = delete;

    /** Whether it came that far, in the latest one's time. */
    static bool HasFailed();
};

} // namespace unit

#endif

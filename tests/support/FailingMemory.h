// Memory that runs out, or whose use is seen. Linking FailingMemory.cpp puts it in force, for the
// loaded plug-in as well.

#pragma once

namespace test {

/// Which allocation from now on fails, counted from 1; 0: none.
extern int failingAllocation;

/// Called by each allocation.
extern void (*onAllocation)();

}  // namespace test

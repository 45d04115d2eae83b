// Memory that runs out. Linking FailingMemory.cpp puts it in force, for the loaded plug-in as well.

#pragma once

namespace test {

/// Which allocation from now on fails, counted from 1; 0: none.
extern int failingAllocation;

}  // namespace test

// Replaces operator new for a test program: the chosen allocation of the calling thread fails once.
#pragma once

namespace kz7::test {

// Makes allocation `number` fail, counted from 0 from now on; below 0: none.
void failAllocation(int number);

// Whether it has failed. Later allocations succeed.
bool endFailingAllocations();

}  // namespace kz7::test

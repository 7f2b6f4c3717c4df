// The operators new and delete of programs that make allocations fail. A program that links
// ReplacedOperators.cpp has them replaced, and defines the function below.
#pragma once

// Whether the allocation that is about to be made fails. Any thread.
bool nextAllocationFails();

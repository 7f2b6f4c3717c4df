// Hooks for the exit of the process and for its forked children. A child lacks the threads of its
// parent, and a mutex that one of them held stays locked there.
#pragma once

namespace glshare {

// Calls `call` when the process exits, while its other threads still run. Does nothing on a system
// that ends all threads first.
void callAtExit(void (*call)());

// Starts to detect forks. Called before the first thread is started. Throws std::bad_alloc.
void detectForks();

// Returns whether this process was forked after detectForks. It must then neither lock nor wait.
[[nodiscard]] bool isForkedChild() noexcept;

} // namespace glshare

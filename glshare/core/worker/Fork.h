// Tells a forked child from its parent. A child lacks its parent's threads, and what those had
// locked stays locked there.
#pragma once

namespace glshare {

// Detects forks from now on. Called before the first thread is started. Throws std::bad_alloc.
void detectForks();

// Whether this process was forked after detectForks. It must then neither lock nor wait.
[[nodiscard]] bool isForkedChild();

} // namespace glshare

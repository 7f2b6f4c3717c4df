#include "host/MemoryMonitor.h"

Zyl::Objects::AMemoryMonitor::~AMemoryMonitor() = default;

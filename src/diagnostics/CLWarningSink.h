// The receiver of the library's warnings. Internal: tests and the diagnostic tool replace it.
#pragma once

// Takes one finished warning, which is valid during the call. May be called from any thread,
// several at once, and must not throw.
using CLWarningSink = void (*)(const char* text);

// Makes `sink` the receiver of all warnings from now on; null restores the built-in sink, which
// writes nothing. Safe from any thread.
void setCLWarningSink(CLWarningSink sink);

#include "host/GLFunctionTable.h"

GLFunctionTable* GLFunctionTable::fpGlobalFunctionTable = nullptr;

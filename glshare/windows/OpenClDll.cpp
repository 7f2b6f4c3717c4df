// An OpenCL.dll that a program loads from its own directory, since layers of the Windows loader
// cannot replace the OpenGL sharing functions. It calls the system's OpenCL.dll, except for the
// functions of EntryPoints.h.
#include "core/api/Settings.h"
#include "entry/EntryPoint.h"
#include "entry/EntryPoints.h"
#include "windows/Direct3D11.h"
#include "windows/OpenClFunctions.h"
#include "windows/SystemOpenCl.h"

#include <exception>

namespace glshare {

namespace {

cl_icd_dispatch makeTable()
{
    cl_icd_dispatch table = loadSystemOpenCl();
    setRuntime(table);
    forbidHostMemory();
    installEntryPoints(table);
    installDirect3D11(table);
    return table;
}

// Created with the first call: a DLL must not load another one while it is loaded.
const cl_icd_dispatch& table()
{
    static const cl_icd_dispatch theTable = makeTable();
    return theTable;
}

// A function that calls `member` of the table, under the same signature.
template <auto member>
struct Forward;

template <typename Result, typename... Arguments,
          Result (CL_API_CALL* cl_icd_dispatch::*member)(Arguments...)>
struct Forward<member> {
    static Result CL_API_CALL call(Arguments... arguments)
    {
        try {
            return (table().*member)(arguments...);
        } catch (const std::exception&) { // no memory for the table
            return failWith<Result>(CL_OUT_OF_HOST_MEMORY, arguments...);
        }
    }
};

} // namespace

} // namespace glshare

// Exports a function under its OpenCL name. The headers have declared that name, so the function
// has another one here, and jumps to Forward::call with its arguments unchanged.
#define GLSHARE_EXPORT(function)                                                                   \
    [[gnu::used]] auto* const glshareTarget_##function =                                           \
        &glshare::Forward<&cl_icd_dispatch::function>::call;                                       \
    extern "C" [[gnu::naked, gnu::dllexport]] void glshareExport_##function() asm(#function);      \
    void glshareExport_##function()                                                                \
    {                                                                                              \
        asm("jmp *%0" : : "m"(glshareTarget_##function));                                          \
    }
GLSHARE_FUNCTIONS(GLSHARE_EXPORT)

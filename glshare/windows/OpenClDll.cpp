// The shell for Windows, where OpenCL's loader knows no layers that reach OpenGL sharing: an
// OpenCL.dll that a program finds beside itself. It passes everything on to the system's, with our
// functions in front.
#include "core/api/Switches.h"
#include "entry/EntryPoint.h"
#include "entry/EntryPoints.h"
#include "windows/Direct3D11.h"
#include "windows/Functions.h"
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

// Made with the first call, not when this library is loaded: one may load no other then.
const cl_icd_dispatch& table()
{
    static const cl_icd_dispatch theTable = makeTable();
    return theTable;
}

// The function that stands for `member` of the table, under the same signature.
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

// Exported under the function's own name, which the headers have declared already; so the function
// has another name here, and jumps to the one above with its arguments untouched.
#define GLSHARE_EXPORT(function)                                                                   \
    [[gnu::used]] auto* const glshareTarget_##function =                                           \
        &glshare::Forward<&cl_icd_dispatch::function>::call;                                       \
    extern "C" [[gnu::naked, gnu::dllexport]] void glshareExport_##function() asm(#function);      \
    void glshareExport_##function()                                                                \
    {                                                                                              \
        asm("jmp *%0" : : "m"(glshareTarget_##function));                                          \
    }
GLSHARE_FUNCTIONS(GLSHARE_EXPORT)

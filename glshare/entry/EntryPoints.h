// The OpenCL functions that glshare implements, under the signatures of the OpenCL headers. They
// return the errors of the OpenCL functions of the same names. Any thread.
#pragma once

#include "core/api/OpenCl.h"

namespace glshare {

// Replaces the functions below in `table`; the others stay.
void installEntryPoints(cl_icd_dispatch& table);

namespace entry {

cl_int CL_API_CALL getPlatformInfo(cl_platform_id platform, cl_platform_info name, std::size_t size,
                                   void* value, std::size_t* sizeNeeded);
cl_int CL_API_CALL getDeviceIds(cl_platform_id platform, cl_device_type type, cl_uint capacity,
                                cl_device_id* devices, cl_uint* count);
cl_int CL_API_CALL getDeviceInfo(cl_device_id device, cl_device_info name, std::size_t size,
                                 void* value, std::size_t* sizeNeeded);

using ContextNotify = void(CL_CALLBACK*)(const char*, const void*, std::size_t, void*);
cl_context CL_API_CALL createContext(const cl_context_properties* properties, cl_uint count,
                                     const cl_device_id* devices, ContextNotify notify, void* user,
                                     cl_int* error);
cl_context CL_API_CALL createContextFromType(const cl_context_properties* properties,
                                             cl_device_type type, ContextNotify notify, void* user,
                                             cl_int* error);
cl_int CL_API_CALL retainContext(cl_context context);
cl_int CL_API_CALL releaseContext(cl_context context);
cl_int CL_API_CALL getContextInfo(cl_context context, cl_context_info name, std::size_t size,
                                  void* value, std::size_t* sizeNeeded);
cl_int CL_API_CALL getGlContextInfo(const cl_context_properties* properties,
                                    cl_gl_context_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded);

cl_mem CL_API_CALL createFromGlBuffer(cl_context context, cl_mem_flags flags, cl_GLuint name,
                                      cl_int* error);
cl_mem CL_API_CALL createFromGlTexture(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                       cl_GLint level, cl_GLuint texture, cl_int* error);
cl_mem CL_API_CALL createFromGlTexture2D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error);
cl_mem CL_API_CALL createFromGlTexture3D(cl_context context, cl_mem_flags flags, cl_GLenum target,
                                         cl_GLint level, cl_GLuint texture, cl_int* error);
cl_mem CL_API_CALL createFromGlRenderbuffer(cl_context context, cl_mem_flags flags,
                                            cl_GLuint renderbuffer, cl_int* error);
cl_int CL_API_CALL getGlObjectInfo(cl_mem memory, cl_gl_object_type* type, cl_GLuint* name);
cl_int CL_API_CALL getGlTextureInfo(cl_mem memory, cl_gl_texture_info name, std::size_t size,
                                    void* value, std::size_t* sizeNeeded);
cl_int CL_API_CALL getMemObjectInfo(cl_mem memory, cl_mem_info name, std::size_t size, void* value,
                                    std::size_t* sizeNeeded);

cl_int CL_API_CALL enqueueAcquireGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event);
cl_int CL_API_CALL enqueueReleaseGlObjects(cl_command_queue queue, cl_uint count,
                                           const cl_mem* memory, cl_uint waitCount,
                                           const cl_event* waitList, cl_event* event);

cl_event CL_API_CALL createEventFromGlSync(cl_context context, cl_GLsync sync, cl_int* error);
cl_int CL_API_CALL getEventInfo(cl_event event, cl_event_info name, std::size_t size, void* value,
                                std::size_t* sizeNeeded);
cl_int CL_API_CALL retainEvent(cl_event event);
cl_int CL_API_CALL releaseEvent(cl_event event);
cl_int CL_API_CALL setUserEventStatus(cl_event event, cl_int status);

void* CL_API_CALL getExtensionFunctionAddress(const char* name);
void* CL_API_CALL getExtensionFunctionAddressForPlatform(cl_platform_id platform, const char* name);

} // namespace entry

} // namespace glshare

#include "SharingTest.h"

#include "tests/support/KeepModulesLoaded.h"

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <iterator>
#include <numeric>
#include <string_view>
#include <thread>

Numbers numbersFrom(cl_int first, std::size_t count)
{
    Numbers numbers(count);
    std::iota(numbers.begin(), numbers.end(), first);
    return numbers;
}

cl_int statusOf(const Event& event)
{
    return infoOf<cl_int>(clGetEventInfo, event, CL_EVENT_COMMAND_EXECUTION_STATUS);
}

std::ptrdiff_t threadCount()
{
    return std::distance(std::filesystem::directory_iterator("/proc/self/task"), {});
}

bool becomesTrue(const std::function<bool()>& condition)
{
    for (int i = 0; i < 10000; ++i) {
        if (condition())
            return true;
        std::this_thread::sleep_for(std::chrono::microseconds(500));
    }
    return false;
}

void onOtherThread(const std::function<void()>& work)
{
    std::thread(work).join();
}

void bindEmptyFramebuffer(GLsizei side)
{
    GLuint frame = 0;
    GLuint vertices = 0;
    glGenFramebuffers(1, &frame);
    glBindFramebuffer(GL_FRAMEBUFFER, frame);
    glFramebufferParameteri(GL_FRAMEBUFFER, GL_FRAMEBUFFER_DEFAULT_WIDTH, side);
    glFramebufferParameteri(GL_FRAMEBUFFER, GL_FRAMEBUFFER_DEFAULT_HEIGHT, side);
    glGenVertexArrays(1, &vertices);
    glBindVertexArray(vertices);
}

namespace {

// OpenCL requires null pointers for empty lists.
const cl_event* eventsOf(const WaitList& waitList)
{
    return waitList.empty() ? nullptr : waitList.data();
}

cl_event* addressOf(Event* event)
{
    return event == nullptr ? nullptr : event->address();
}

} // namespace

Queue::Queue(cl_context context, cl_device_id device, cl_command_queue_properties kind)
    : fQueue(clCreateCommandQueue(context, device, kind, nullptr))
{
    EXPECT_NE(fQueue, nullptr);
}

cl_int Queue::share(decltype(&clEnqueueAcquireGLObjects) call, cl_mem memory,
                    const WaitList& waitList, Event* event) const
{
    return call(fQueue, 1, &memory, static_cast<cl_uint>(waitList.size()), eventsOf(waitList),
                addressOf(event));
}

void Queue::fill(cl_mem memory, cl_int value, const WaitList& waitList, Event* event) const
{
    const auto size = infoOf<std::size_t>(clGetMemObjectInfo, memory, CL_MEM_SIZE);
    EXPECT_EQ(clEnqueueFillBuffer(fQueue, memory, &value, sizeof value, 0, size,
                                  static_cast<cl_uint>(waitList.size()), eventsOf(waitList),
                                  addressOf(event)),
              CL_SUCCESS);
}

Numbers Queue::read(cl_mem memory, std::size_t count) const
{
    Numbers numbers(count);
    EXPECT_EQ(clEnqueueReadBuffer(fQueue, memory, CL_TRUE, 0, count * sizeof(cl_int),
                                  numbers.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
    return numbers;
}

void Queue::write(cl_mem memory, const Numbers& numbers) const
{
    EXPECT_EQ(clEnqueueWriteBuffer(fQueue, memory, CL_TRUE, 0, numbers.size() * sizeof(cl_int),
                                   numbers.data(), 0, nullptr, nullptr),
              CL_SUCCESS);
}

void Queue::rewrite(cl_mem memory, const Numbers& before, const Numbers& after) const
{
    ASSERT_EQ(acquire(memory), CL_SUCCESS);
    EXPECT_EQ(read(memory, before.size()), before);
    write(memory, after);
    ASSERT_EQ(release(memory), CL_SUCCESS);
    clFinish(fQueue);
}

void SharingTest::SetUp()
{
    openGl();
    if (IsSkipped() || HasFatalFailure())
        return;
    keepModulesLoaded();
    if (clGetPlatformIDs(1, &fPlatform, nullptr) != CL_SUCCESS)
        GTEST_SKIP() << "no OpenCL runtime here";
    ASSERT_NE(extensionsOf(fPlatform).find("cl_khr_gl_sharing"), std::string::npos)
        << "the layer is not active";
    ASSERT_EQ(clGetDeviceIDs(fPlatform, CL_DEVICE_TYPE_ALL, 1, &fDevice, nullptr), CL_SUCCESS);
    fContext = makeContext();
    ASSERT_NE(fContext, nullptr);
    fQueue = Queue(fContext, fDevice);
    fBuffer = makeGlBuffer(from(1));
    glFinish();
    fMemory = share(fBuffer);
}

void SharingTest::openGl()
{
    if (EglTestContext::display() == EGL_NO_DISPLAY)
        GTEST_SKIP() << "EGL has no display without a window system here";
    fGl = std::make_unique<EglTestContext>();
    if (!fGl->valid())
        GTEST_SKIP() << "no OpenGL 4.5 here";
    fGl->makeCurrent();
    fGlEntries = fGl->entries();
}

bool SharingTest::isOn(const char* variable, bool byDefault)
{
    const char* value = std::getenv(variable);
    return value == nullptr ? byDefault : std::string_view(value) != "0";
}

std::string SharingTest::extensionsOf(cl_platform_id platform)
{
    std::size_t size = 0;
    clGetPlatformInfo(platform, CL_PLATFORM_EXTENSIONS, 0, nullptr, &size);
    std::string text(size, '\0');
    clGetPlatformInfo(platform, CL_PLATFORM_EXTENSIONS, size, text.data(), nullptr);
    return text.c_str();
}

Properties SharingTest::properties(const Properties& entries) const
{
    Properties list{CL_CONTEXT_PLATFORM, reinterpret_cast<cl_context_properties>(fPlatform)};
    list.insert(list.end(), entries.begin(), entries.end());
    list.push_back(0);
    return list;
}

Context SharingTest::makeContext(const Properties& list) const
{
    cl_int error = CL_INVALID_VALUE;
    Context context = clCreateContext(list.data(), 1, &fDevice, nullptr, nullptr, &error);
    EXPECT_EQ(error, CL_SUCCESS);
    return context;
}

GLuint SharingTest::makeGlBuffer(const Numbers& numbers)
{
    GLuint buffer = 0;
    glGenBuffers(1, &buffer);
    reallocate(buffer, numbers);
    return buffer;
}

Memory SharingTest::share(cl_context context, GLuint buffer, cl_mem_flags flags)
{
    cl_int error = CL_INVALID_VALUE;
    Memory memory = clCreateFromGLBuffer(context, flags, buffer, &error);
    EXPECT_EQ(error, CL_SUCCESS);
    EXPECT_NE(memory, nullptr);
    return memory;
}

void SharingTest::reallocate(GLuint buffer, const Numbers& numbers)
{
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(numbers.size() * sizeof(cl_int)),
                 numbers.data(), GL_DYNAMIC_DRAW);
}

void SharingTest::overwrite(GLuint buffer, const Numbers& numbers)
{
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glBufferSubData(GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(numbers.size() * sizeof(cl_int)),
                    numbers.data());
}

Numbers SharingTest::readGl(GLuint buffer, std::size_t count)
{
    Numbers numbers(count);
    glBindBuffer(GL_ARRAY_BUFFER, buffer);
    glGetBufferSubData(GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(count * sizeof(cl_int)),
                       numbers.data());
    return numbers;
}

// The kernels of the deformers on an OpenCL runtime, compared with their CPU sides and with the
// bounds of their errors.
#include "DeformerCases.h"
#include "evaluator/SkinDeformer.h"
#include "evaluator/VectorMath.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <fstream>
#include <iterator>
#include <map>
#include <memory>
#include <string>
#include <type_traits>
#include <utility>

#include <gtest/gtest.h>

namespace {

using namespace vyra;

constexpr std::size_t kWorkGroup = 74;
constexpr double kHalfUnit = 0x1p-24; // of the last place of a float, relative
const std::string kKernels = VYRA_EVALUATOR_KERNELS;

// Own references. The library's holders need the library's runtime.
using Memory = std::shared_ptr<std::remove_pointer_t<cl_mem>>;
using Program = std::shared_ptr<std::remove_pointer_t<cl_program>>;
using Kernel = std::shared_ptr<std::remove_pointer_t<cl_kernel>>;

// Runs kernels on the first OpenCL device, without the evaluator. A failing call fails the test.
class Device {
public:
    // False if there is no device.
    bool open()
    {
        cl_platform_id platform = nullptr;
        if (clGetPlatformIDs(1, &platform, nullptr) != CL_SUCCESS ||
            clGetDeviceIDs(platform, CL_DEVICE_TYPE_ALL, 1, &fDevice, nullptr) != CL_SUCCESS)
            return false;
        fContext = clCreateContext(nullptr, 1, &fDevice, nullptr, nullptr, nullptr);
        fQueue = clCreateCommandQueue(fContext, fDevice, 0, nullptr);
        return fQueue != nullptr;
    }

    ~Device()
    {
        fPrograms.clear();
        if (fQueue)
            clReleaseCommandQueue(fQueue);
        if (fContext)
            clReleaseContext(fContext);
    }

    bool supportsDouble() const
    {
        cl_device_fp_config config = 0;
        clGetDeviceInfo(fDevice, CL_DEVICE_DOUBLE_FP_CONFIG, sizeof(config), &config, nullptr);
        return config != 0;
    }

    Kernel kernel(const std::string& path, const std::string& function, const std::string& options)
    {
        Program& program = fPrograms[path + options];
        if (!program)
            program = build(path, options);
        return {clCreateKernel(program.get(), function.c_str(), nullptr), clReleaseKernel};
    }

    template <typename T>
    Memory memory(std::span<const T> values)
    {
        return {clCreateBuffer(fContext, CL_MEM_COPY_HOST_PTR, values.size_bytes(),
                               const_cast<T*>(values.data()), nullptr),
                clReleaseMemObject};
    }

    void run(cl_kernel kernel, std::size_t count)
    {
        const std::size_t global = (count + kWorkGroup - 1) / kWorkGroup * kWorkGroup;
        EXPECT_EQ(clEnqueueNDRangeKernel(fQueue, kernel, 1, nullptr, &global, &kWorkGroup, 0,
                                         nullptr, nullptr),
                  CL_SUCCESS);
    }

    template <typename T>
    void read(cl_mem memory, std::vector<T>& values)
    {
        EXPECT_EQ(clEnqueueReadBuffer(fQueue, memory, CL_TRUE, 0, values.size() * sizeof(T),
                                      values.data(), 0, nullptr, nullptr),
                  CL_SUCCESS);
    }

private:
    Program build(const std::string& path, const std::string& options)
    {
        std::ifstream file(path);
        const std::string source(std::istreambuf_iterator<char>(file), {});
        const char* text = source.c_str();
        const Program program(clCreateProgramWithSource(fContext, 1, &text, nullptr, nullptr),
                              clReleaseProgram);
        const std::string flags = "-cl-no-signed-zeros -Werror -I " + kKernels + " " + options;
        const cl_int status =
            clBuildProgram(program.get(), 1, &fDevice, flags.c_str(), nullptr, nullptr);
        char log[4096] = "";
        clGetProgramBuildInfo(program.get(), fDevice, CL_PROGRAM_BUILD_LOG, sizeof(log), log,
                              nullptr);
        EXPECT_EQ(status, CL_SUCCESS) << path << ' ' << log;
        return program;
    }

    cl_device_id fDevice = nullptr;
    cl_context fContext = nullptr;
    cl_command_queue fQueue = nullptr;
    std::map<std::string, Program> fPrograms; // by path and options
};

class Arguments final : public KernelArguments {
public:
    Arguments(Device& device, cl_kernel kernel) : fDevice(device), fKernel(kernel) {}

    void constant(const ConstantArray& array) override
    {
        Memory memory;
        if (array.sizeInBytes())
            memory = fDevice.memory(array.values<char>());
        add(memory);
    }
    void add(const Memory& memory)
    {
        fMemory.push_back(memory);
        KernelArguments::value(memory.get());
    }

private:
    void setValue(const void* value, std::size_t sizeInBytes) override
    {
        EXPECT_EQ(clSetKernelArg(fKernel, fIndex++, sizeInBytes, value), CL_SUCCESS);
    }
    // After numbers of another deformer.
    void setFrame(const void* bytes, std::size_t sizeInBytes) override
    {
        const auto* begin = static_cast<const char*>(bytes);
        std::vector<char> all(3 * sizeof(cl_float4), 0x7f);
        all.insert(all.end(), begin, begin + sizeInBytes);
        add(fDevice.memory(std::span<const char>(all)));
        KernelArguments::value(cl_uint{3});
    }

    Device& fDevice;
    cl_kernel fKernel;
    cl_uint fIndex = 0;
    std::vector<Memory> fMemory;
};

class DeformerKernels : public testing::Test {
protected:
    void SetUp() override
    {
        if (!fDevice.open())
            GTEST_SKIP() << "no OpenCL device";
    }

    bool canRun(const Deformer& deformer) const
    {
        return fDevice.supportsDouble() || deformer.kernel(0).options.empty();
    }

    // All passes, from one pair of buffers to another, or in one. Nothing is written past the end.
    Surface deform(Deformer& deformer, const Surface& surface, bool inPlace = false)
    {
        const auto count = static_cast<cl_uint>(surface.vertexCount());
        const Vector3 guard{1e30f, 2e30f, 3e30f};
        Surface padded = surface;
        padded.positions.resize(count + kWorkGroup, guard);
        padded.normals.resize(count + kWorkGroup, guard);
        Buffers input = buffers(padded);
        for (unsigned pass = 0; pass < deformer.passCount(); ++pass) {
            const Buffers output = inPlace ? input : buffers(padded);
            const KernelSource source = deformer.kernel(pass);
            const auto kernel =
                fDevice.kernel(kKernels + "/" + std::string(source.file),
                               std::string(source.function), std::string(source.options));
            Arguments arguments(fDevice, kernel.get());
            arguments.value(count);
            for (const auto& memory :
                 {input.positions, input.normals, output.positions, output.normals})
                arguments.add(memory);
            deformer.setArguments(pass, arguments);
            fDevice.run(kernel.get(), count);
            fDevice.read(output.positions.get(), padded.positions);
            input = output;
        }
        fDevice.read(input.normals.get(), padded.normals);
        for (std::size_t i = count; i < padded.vertexCount(); ++i) {
            EXPECT_EQ(padded.positions[i].z, guard.z);
            EXPECT_EQ(padded.normals[i].x, guard.x);
        }
        padded.positions.resize(count);
        padded.normals.resize(count);
        return padded;
    }

    Device fDevice;

private:
    struct Buffers {
        Memory positions;
        Memory normals;
    };
    Buffers buffers(const Surface& surface)
    {
        return {fDevice.memory(std::span<const Vector3>(surface.positions)),
                fDevice.memory(std::span<const Vector3>(surface.normals))};
    }
};

class DeformerKernel : public DeformerKernels, public testing::WithParamInterface<DeformerCase> {};

INSTANTIATE_TEST_SUITE_P(All, DeformerKernel, testing::ValuesIn(deformerCases()),
                         [](const auto& row) { return std::string(row.param.name); });

TEST_P(DeformerKernel, EqualsItsCpuSide)
{
    constexpr double kBound = 2e-5;
    const MeshGeometry sheet = makeSheet(31);
    // The last work-group lacks one vertex.
    ASSERT_EQ((sheet.rest.vertexCount() + 1) % kWorkGroup, 0u);
    const std::unique_ptr<Deformer> deformer = GetParam().make(sheet);
    ASSERT_EQ(deformer->mismatch(sheet), "");
    if (!canRun(*deformer))
        GTEST_SKIP() << "the device has no double precision";
    Surface mirrored = sheet.rest;
    for (std::size_t i = 0; i < mirrored.vertexCount(); ++i) {
        mirrored.positions[i].x *= -1;
        mirrored.normals[i].x *= -1;
    }
    for (const auto& [surface, inPlace] :
         {std::pair(sheet.rest, false), {mirrored, !deformer->readsNeighbours()}}) {
        Surface expected = surface;
        deformer->deform(sheet, expected);
        const Surface actual = deform(*deformer, surface, inPlace);
        for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
            const auto distance = [](const Vector3& a, const Vector3& b) {
                return length(wide(a) - wide(b));
            };
            ASSERT_LT(distance(actual.positions[i], expected.positions[i]), kBound) << i;
            ASSERT_LT(distance(actual.normals[i], expected.normals[i]), kBound) << i;
        }
    }
}

// |a| . |b|, with the terms' magnitudes.
double magnitudes(const Vector& a, const Vector& b)
{
    return std::abs(a.x * b.x) + std::abs(a.y * b.y) + std::abs(a.z * b.z);
}

Vector magnitudes(const Vector& v)
{
    return {std::abs(v.x), std::abs(v.y), std::abs(v.z)};
}

// The cross product with all terms positive.
Vector positiveCross(const Vector& a, const Vector& b)
{
    return {a.y * b.z + a.z * b.y, a.z * b.x + a.x * b.z, a.x * b.y + a.y * b.x};
}

struct Bounds {
    Vector position; // per coordinate
    double normal = 0;
};

// The bounds of the errors in single precision that SkinDeformer.h states.
Bounds skinBounds(const SkinDeformer& skin, std::size_t vertex, const Surface& rest)
{
    const auto indices = skin.weights().bones().values<SkinWeights::BoneIndices>()[vertex];
    const auto weights = skin.weights().weights().values<SkinWeights::BoneWeights>()[vertex];
    const Vector p = wide(rest.positions[vertex]);
    const Vector n = wide(rest.normals[vertex]);
    Affine sum{};
    Affine sizes{};
    Vector position;
    for (std::size_t i = 0; i < SkinWeights::kInfluences; ++i) {
        const Affine bone = wide(skin.bones[indices[i]]);
        const double w = weights[i];
        position += w * (Vector{magnitudes(bone.rows[0], p), magnitudes(bone.rows[1], p),
                                magnitudes(bone.rows[2], p)} +
                         magnitudes(bone.offset));
        for (std::size_t row = 0; row < 3; ++row) {
            sum.rows[row] += w * bone.rows[row];
            sizes.rows[row] += w * magnitudes(bone.rows[row]);
        }
    }
    const auto& r = sizes.rows;
    const auto c = cofactors(sum);
    const Vector exact{dot(c[0], n), dot(c[1], n), dot(c[2], n)};
    const Vector positive{magnitudes(positiveCross(r[1], r[2]), n),
                          magnitudes(positiveCross(r[2], r[0]), n),
                          magnitudes(positiveCross(r[0], r[1]), n)};
    return {8.01 * kHalfUnit * position, kHalfUnit * (15 * length(positive) / length(exact) + 6)};
}

TEST_F(DeformerKernels, SkinStaysWithinItsBoundFarFromTheOrigin)
{
    const MeshGeometry sheet = makeSheet(101);
    const auto deformer = deformerCases()[0].make(sheet);
    auto& skin = dynamic_cast<SkinDeformer&>(*deformer);
    for (const float distance : {0.0f, 1e3f, 1e6f}) {
        for (MatrixRows& bone : skin.bones)
            bone[3] += distance;
        for (const unsigned precision : {SkinDeformer::kSingle, SkinDeformer::kDouble}) {
            SCOPED_TRACE(testing::Message() << distance << ' ' << precision);
            skin.precision = precision;
            if (!canRun(skin))
                continue;
            Surface exact = sheet.rest;
            skin.deform(sheet, exact);
            const Surface actual = deform(skin, sheet.rest);
            double largest = 0; // part of the bound
            for (std::size_t i = 0; i < exact.vertexCount(); ++i) {
                const Bounds bounds = skinBounds(skin, i, sheet.rest);
                const Vector error =
                    magnitudes(wide(actual.positions[i]) - wide(exact.positions[i]));
                largest = std::max(
                    {largest, error.x / bounds.position.x, error.y / bounds.position.y,
                     error.z / bounds.position.z,
                     length(wide(actual.normals[i]) - wide(exact.normals[i])) / bounds.normal});
            }
            EXPECT_LT(largest, 1);
            if (precision == SkinDeformer::kDouble)
                EXPECT_LT(largest, 0.01); // the results are rounded alike
            else
                EXPECT_GT(largest, 0.05); // the bound is not idle
        }
    }
}

TEST_F(DeformerKernels, SineAndCosineStayWithinTheirBound)
{
    constexpr double kBound = 1e-7;
    constexpr std::uint32_t kStride = 997; // in units of the last place
    std::vector<float> angles;
    const auto end = std::bit_cast<std::uint32_t>(1e5f);
    for (std::uint32_t bits = 0; bits <= end; bits += kStride)
        angles.push_back(bits % 2 ? -std::bit_cast<float>(bits) : std::bit_cast<float>(bits));
    const std::size_t withinBound = angles.size();
    angles.insert(angles.end(), {2e5f, -1e6f, 1e7f, 3e9f, -1e20f, 3e38f});
    const auto count = static_cast<cl_uint>(angles.size());
    std::vector<float> sines(angles.size());
    std::vector<float> cosines(angles.size());
    for (const char* options : {"", "-D NotFused"}) {
        SCOPED_TRACE(options);
        const auto kernel =
            fDevice.kernel(VYRA_TEST_KERNELS "/sine_and_cosine.cl", "sinesAndCosines", options);
        Arguments arguments(fDevice, kernel.get());
        arguments.value(count);
        const auto sineMemory = fDevice.memory(std::span<const float>(sines));
        const auto cosineMemory = fDevice.memory(std::span<const float>(cosines));
        arguments.add(fDevice.memory(std::span<const float>(angles)));
        arguments.add(sineMemory);
        arguments.add(cosineMemory);
        fDevice.run(kernel.get(), count);
        fDevice.read(sineMemory.get(), sines);
        fDevice.read(cosineMemory.get(), cosines);

        double largest = 0;
        for (std::size_t i = 0; i < withinBound; ++i) {
            const double angle = angles[i];
            largest = std::max({largest, std::abs(sines[i] - std::sin(angle)),
                                std::abs(cosines[i] - std::cos(angle))});
        }
        EXPECT_LT(largest, kBound);
        for (std::size_t i = withinBound; i < angles.size(); ++i)
            EXPECT_NEAR(std::hypot(sines[i], cosines[i]), 1, 1e-6) << angles[i];
    }
}

} // namespace

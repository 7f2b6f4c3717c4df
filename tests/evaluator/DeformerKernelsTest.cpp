// The kernels of the deformers on an OpenCL runtime, compared with their CPU sides and with the
// bounds of their errors.
#define CL_HPP_ENABLE_EXCEPTIONS
#define CL_HPP_MINIMUM_OPENCL_VERSION 120
#define CL_HPP_TARGET_OPENCL_VERSION 120
#include <CL/opencl.hpp>

#include "DeformerCases.h"
#include "evaluator/VectorMath.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <fstream>
#include <map>
#include <string>
#include <utility>

#include <gtest/gtest.h>

namespace {

using namespace vyra;

constexpr std::size_t kWorkGroup = 74;
constexpr double kHalfUnit = 0x1p-24; // of the last place of a float, relative
const std::string kKernels = VYRA_EVALUATOR_KERNELS;

// Sets the arguments of a kernel and keeps their memory.
class Arguments final : public KernelArguments {
public:
    Arguments(const cl::Context& context, cl::Kernel& kernel) : fContext(context), fKernel(kernel)
    {
    }

    void add(const cl::Buffer& memory)
    {
        fMemory.push_back(memory);
        fKernel.setArg(fIndex++, memory);
    }
    void add(const void* bytes, std::size_t size)
    {
        add(cl::Buffer(fContext, CL_MEM_COPY_HOST_PTR, size, const_cast<void*>(bytes)));
    }
    void constant(const ConstantArray& array) override
    {
        if (array.sizeInBytes())
            add(array.values<char>().data(), array.sizeInBytes());
        else
            add(cl::Buffer());
    }

private:
    void setValue(const void* value, std::size_t sizeInBytes) override
    {
        fKernel.setArg(fIndex++, sizeInBytes, value);
    }
    // Placed after frame data of another deformer.
    void setFrame(const void* bytes, std::size_t sizeInBytes) override
    {
        std::string all(3 * sizeof(cl_float4), 0x7f);
        all.append(static_cast<const char*>(bytes), sizeInBytes);
        add(all.data(), all.size());
        value(cl_uint{3});
    }

    const cl::Context& fContext;
    cl::Kernel& fKernel;
    cl_uint fIndex = 0;
    std::vector<cl::Buffer> fMemory;
};

// Runs kernels on the first OpenCL device, without the evaluator. A call that fails throws.
class DeformerKernels : public testing::Test {
protected:
    void SetUp() override
    {
        std::vector<cl::Platform> platforms;
        std::vector<cl::Device> devices;
        try {
            cl::Platform::get(&platforms);
            platforms.at(0).getDevices(CL_DEVICE_TYPE_ALL, &devices);
        } catch (const cl::Error&) {
            GTEST_SKIP() << "no OpenCL device";
        }
        fDevice = devices.at(0);
        fContext = cl::Context(fDevice);
        fQueue = cl::CommandQueue(fContext, fDevice);
    }

    bool canRun(const Deformer& deformer) const
    {
        return fDevice.getInfo<CL_DEVICE_DOUBLE_FP_CONFIG>() != 0 ||
               deformer.kernel(0).options.empty();
    }

    cl::Kernel kernel(const std::string& path, std::string_view function, std::string_view options)
    {
        cl::Program& program = fPrograms[path.c_str() + std::string(options)];
        if (!program()) {
            std::ifstream file(path);
            program = cl::Program(fContext, std::string(std::istreambuf_iterator<char>(file), {}));
            try {
                program.build(
                    ("-cl-no-signed-zeros -Werror -I " + kKernels + " ").append(options).c_str());
            } catch (const cl::BuildError& error) {
                ADD_FAILURE() << path << ' ' << error.getBuildLog()[0].second;
            }
        }
        return {program, std::string(function).c_str()};
    }

    void run(const cl::Kernel& kernel, std::size_t count)
    {
        const cl::NDRange global((count + kWorkGroup - 1) / kWorkGroup * kWorkGroup);
        fQueue.enqueueNDRangeKernel(kernel, cl::NullRange, global, cl::NDRange(kWorkGroup));
    }

    template <typename T>
    cl::Buffer memory(std::vector<T>& values)
    {
        return {fContext, CL_MEM_COPY_HOST_PTR, values.size() * sizeof(T), values.data()};
    }
    template <typename T>
    void read(const cl::Buffer& memory, std::vector<T>& values)
    {
        fQueue.enqueueReadBuffer(memory, CL_TRUE, 0, values.size() * sizeof(T), values.data());
    }

    // All passes, from one pair of buffers to another, or in one. Nothing is written past the end.
    Surface deform(Deformer& deformer, const Surface& surface, bool inPlace = false)
    {
        const auto count = static_cast<cl_uint>(surface.vertexCount());
        const Vector3 guard{1e30f, 2e30f, 3e30f};
        Surface padded = surface;
        padded.positions.resize(count + kWorkGroup, guard);
        padded.normals.resize(count + kWorkGroup, guard);
        std::pair input(memory(padded.positions), memory(padded.normals));
        for (unsigned pass = 0; pass < deformer.passCount(); ++pass) {
            const std::pair output =
                inPlace ? input : std::pair(memory(padded.positions), memory(padded.normals));
            const KernelSource source = deformer.kernel(pass);
            cl::Kernel passKernel =
                kernel(kKernels + "/" + std::string(source.file), source.function, source.options);
            Arguments arguments(fContext, passKernel);
            arguments.value(count);
            for (const auto& each : {input.first, input.second, output.first, output.second})
                arguments.add(each);
            deformer.setArguments(pass, arguments);
            run(passKernel, count);
            read(output.first, padded.positions);
            input = output;
        }
        read(input.second, padded.normals);
        for (std::size_t i = count; i < padded.vertexCount(); ++i) {
            EXPECT_EQ(padded.positions[i].z, guard.z);
            EXPECT_EQ(padded.normals[i].x, guard.x);
        }
        padded.positions.resize(count);
        padded.normals.resize(count);
        return padded;
    }

    cl::Device fDevice;
    cl::Context fContext;
    cl::CommandQueue fQueue;
    std::map<std::string, cl::Program> fPrograms; // by path and options
};

class DeformerKernel : public DeformerKernels, public testing::WithParamInterface<DeformerCase> {};

INSTANTIATE_TEST_SUITE_P(All, DeformerKernel, testing::ValuesIn(deformerCases()),
                         testing::PrintToStringParamName());

TEST_P(DeformerKernel, KernelMatchesCpu)
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
    for (auto* vectors : {&mirrored.positions, &mirrored.normals})
        for (Vector3& vector : *vectors)
            vector.x *= -1;
    for (const auto& [surface, inPlace] :
         {std::pair(sheet.rest, false), {mirrored, !deformer->readsNeighbours()}}) {
        Surface expected = surface;
        deformer->deform(sheet, expected);
        const Surface actual = deform(*deformer, surface, inPlace);
        for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
            ASSERT_LT(length(wide(actual.positions[i]) - wide(expected.positions[i])), kBound) << i;
            ASSERT_LT(length(wide(actual.normals[i]) - wide(expected.normals[i])), kBound) << i;
        }
    }
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

// The bounds of the errors in single precision that SkinDeformer.h states: of the position, per
// coordinate, and of the normal.
std::pair<Vector, double> skinBounds(const SkinDeformer& skin, std::size_t i, const Surface& rest)
{
    Affine sum{};
    Affine sizes{}; // the sum of the terms' magnitudes
    for (std::size_t k = 0; k < SkinWeights::kInfluences; ++k) {
        const Affine bone =
            wide(skin.bones[skin.weights().bones().values<SkinWeights::BoneIndices>()[i][k]]);
        const double w = skin.weights().weights().values<SkinWeights::BoneWeights>()[i][k];
        for (std::size_t row = 0; row < 3; ++row) {
            sum.rows[row] += w * bone.rows[row];
            sizes.rows[row] += w * magnitudes(bone.rows[row]);
        }
        sizes.offset += w * magnitudes(bone.offset);
    }
    const auto apply = [](const auto& rows, const Vector& n) {
        return Vector{dot(rows[0], n), dot(rows[1], n), dot(rows[2], n)};
    };
    const Vector n = wide(rest.normals[i]);
    const auto& r = sizes.rows;
    const std::array positive{positiveCross(r[1], r[2]), positiveCross(r[2], r[0]),
                              positiveCross(r[0], r[1])};
    const double growth = length(apply(positive, magnitudes(n))) / length(apply(cofactors(sum), n));
    return {8.01 * kHalfUnit * transformPoint(sizes, magnitudes(wide(rest.positions[i]))),
            kHalfUnit * (15 * growth + 6)};
}

TEST_F(DeformerKernels, SkinErrorStaysWithinBoundFarFromOrigin)
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
                const auto& [position, normal] = skinBounds(skin, i, sheet.rest);
                const Vector error =
                    magnitudes(wide(actual.positions[i]) - wide(exact.positions[i]));
                largest = std::max(
                    {largest, error.x / position.x, error.y / position.y, error.z / position.z,
                     length(wide(actual.normals[i]) - wide(exact.normals[i])) / normal});
            }
            EXPECT_LT(largest, 1);
            if (precision == SkinDeformer::kDouble)
                EXPECT_LT(largest, 0.01); // both results have the same rounding
            else
                EXPECT_GT(largest, 0.05); // the bound is not too wide
        }
    }
}

TEST_F(DeformerKernels, SineAndCosineStayWithinBound)
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
        cl::Kernel both = kernel(VYRA_TEST_KERNELS "/evaluator/kernels/sine_and_cosine.cl",
                                 "sinesAndCosines", options);
        const std::array buffers{memory(angles), memory(sines), memory(cosines)};
        Arguments arguments(fContext, both);
        arguments.value(count);
        for (const cl::Buffer& buffer : buffers)
            arguments.add(buffer);
        run(both, count);
        read(buffers[1], sines);
        read(buffers[2], cosines);

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

// Runs each kernel once, for tools that check memory accesses.
TEST_F(DeformerKernels, TestKernelsLeavePaddingUnchanged)
{
    constexpr cl_uint kCount = kWorkGroup + 1;
    for (const char* function : {"add", "scale", "sinesAndCosines"}) {
        SCOPED_TRACE(function);
        const bool isDeformer = std::string_view(function) != "sinesAndCosines";
        cl::Kernel tested =
            kernel(isDeformer ? VYRA_TEST_KERNELS "/library/kernels/deform.cl"
                              : VYRA_TEST_KERNELS "/evaluator/kernels/sine_and_cosine.cl",
                   function, "");
        std::vector<float> values(2 * kWorkGroup, 0.5f);
        const std::array buffers{memory(values), memory(values), memory(values)};
        Arguments arguments(fContext, tested);
        if (isDeformer) {
            arguments.add(buffers[1]);
            arguments.value(3.0f);
        }
        arguments.value(kCount);
        if (!isDeformer) {
            for (const cl::Buffer& buffer : buffers)
                arguments.add(buffer);
        }
        run(tested, kCount);
        read(buffers[1], values);
        EXPECT_NE(values[kCount - 1], 0.5f);
        EXPECT_EQ(values[kCount], 0.5f);
    }
}

} // namespace

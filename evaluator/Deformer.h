// The base class of deformers.
#pragma once

#include "evaluator/EvaluatorExport.h"
#include "evaluator/Geometry.h"
#include "evaluator/KernelArguments.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace vyra {

// The kernel of one pass of a deformer. The texts are borrowed: literals, or members of the
// deformer.
struct KernelSource {
    // A file in one of the kernel directories, or an absolute path.
    std::string_view file;
    std::string_view function;
    // Build options in addition to those of all deformers, such as "-D UseDouble". Each option
    // string is a program of its own.
    std::string_view options = {};
    // The source itself; `file` is then only a name, which no other source has.
    std::string_view text = {};

    bool operator==(const KernelSource&) const = default;
};

// A setting of a deformer that programs can list, and set from text.
struct DeformerParameter {
    std::string_view name;        // "amplitude"
    std::string_view description; // with the unit, for help texts
    // Where the value is stored: a number between `least` and `greatest`, or the index of one of
    // `choices`.
    std::variant<float*, unsigned*> value;
    float least = 0;
    float greatest = 0;
    std::vector<std::string_view> choices = {};
};

// One step of a mesh's chain of deformers: a kernel, and the same computation on the CPU.
//
// A subclass is one pair of files and one kernel file. The kernel's first five arguments are the
// same for all deformers:
//
//     kernel void name(const uint vertexCount,
//                      global const float* positions, global const float* normals,
//                      global float* deformedPositions, global float* deformedNormals,
//                      ...)                              the arguments from setArguments
//
// One work-item computes one vertex; work-items from `vertexCount` on return at once. Positions and
// normals are packed, three floats each. Unless readsNeighbours() returns true, input and output
// may be the same memory, so a work-item reads its own vertex before it writes it, and no other.
//
// A deformer belongs to one mesh. The host changes its settings between evaluations; during an
// evaluation one worker thread at a time calls its functions. Functions that return text return an
// empty text for "no problem".
class VYRA_EVALUATOR_API Deformer {
public:
    Deformer() = default;
    virtual ~Deformer();
    Deformer(const Deformer&) = delete;
    Deformer& operator=(const Deformer&) = delete;

    // The evaluator skips a deformer that is not enabled.
    bool enabled = true;

    // Returns the name in messages, traces and option texts, such as "wave".
    virtual const char* name() const = 0;

    // Returns why the settings do not fit the mesh, such as a bone index out of range. Called
    // before each evaluation, so it only compares sizes; checks of whole arrays belong in
    // constructors.
    [[nodiscard]] virtual std::string mismatch(const MeshGeometry& geometry) const;

    // Returns the number of kernels that run one after another; 0 if the present settings do not
    // change the mesh.
    virtual unsigned passCount() const;
    virtual KernelSource kernel(unsigned pass) const = 0;
    // Returns whether a pass reads other vertices than its own. It then never runs in place.
    virtual bool readsNeighbours() const;
    // Adds the arguments of a pass. Called in each evaluation.
    virtual void setArguments(unsigned pass, KernelArguments& arguments) = 0;

    // Deforms `surface` in place on the CPU: the reference of tests, and the fallback for small
    // meshes and machines without OpenCL. All passes; computes in double precision.
    virtual void deform(const MeshGeometry& geometry, Surface& surface) const = 0;

    // Returns the settings that can be listed and set by name. The pointers are valid as long as
    // the deformer.
    virtual std::vector<DeformerParameter> parameters();
};

// Sets one parameter from text. Returns an empty text, or a sentence that describes the error and
// lists the names or values that are accepted.
VYRA_EVALUATOR_API std::string setParameter(Deformer& deformer, std::string_view name,
                                            std::string_view value);

} // namespace vyra

#include "evaluator/WaveDeformer.h"

#include "evaluator/VectorMath.h"

#include <cmath>
#include <numbers>

namespace vyra {
namespace {

constexpr float kLargestLength = 1000;
constexpr float kShortestWave = 0.001f;
constexpr float kLargestPhase = 100000;

// The wave in the mesh's space: a point p becomes p + sin(gradient . p + start) * displacement.
struct MeshWave {
    Vector gradient;
    double start;
    Vector displacement;
    double stretch; // gradient . displacement
};

MeshWave meshWave(const WaveDeformer& wave)
{
    const Affine to = wide(wave.space);
    const Affine from = inverse(to);
    const double perUnit = 2 * std::numbers::pi / wave.wavelength;
    const auto unit = [](unsigned axis) {
        return Vector{axis == WaveDeformer::kX ? 1.0 : 0.0, axis == WaveDeformer::kY ? 1.0 : 0.0,
                      axis == WaveDeformer::kZ ? 1.0 : 0.0};
    };
    const double phase = std::remainder(double{wave.phase}, 2 * std::numbers::pi);
    return {perUnit * transformTransposed(to, unit(wave.direction)),
            perUnit * dot(unit(wave.direction), to.offset) - phase,
            wave.amplitude * transformVector(from, unit(wave.displacement)),
            wave.direction == wave.displacement ? perUnit * wave.amplitude : 0};
}

void addVector(KernelArguments& arguments, const Vector& v, double fourth)
{
    for (const double number : {v.x, v.y, v.z, fourth})
        arguments.value(static_cast<float>(number));
}

} // namespace

std::string WaveDeformer::mismatch(const MeshGeometry& /*geometry*/) const
{
    if (!(wavelength > 0) || !std::isfinite(wavelength))
        return "the wavelength is " + std::to_string(wavelength) + "; set one above 0";
    if (direction > kZ || displacement > kZ)
        return "direction and displacement are axes from 0 to 2, and the values are " +
               std::to_string(direction) + " and " + std::to_string(displacement);
    if (!isInvertible(wide(space)))
        return "the matrix to the space of the wave has no inverse; set WaveDeformer::space to one "
               "that has";
    return {};
}

KernelSource WaveDeformer::kernel(unsigned /*pass*/) const
{
    return {"wave.cl", "wave"};
}

void WaveDeformer::setArguments(unsigned /*pass*/, KernelArguments& arguments)
{
    const MeshWave wave = meshWave(*this);
    addVector(arguments, wave.gradient, wave.start);
    addVector(arguments, wave.displacement, wave.stretch);
}

// With g the gradient, u the displacement and c = cos(g . p + start), the Jacobian is
// I + c u g^T. Its transposed inverse times its determinant 1 + c (g . u) turns a normal n into
// (1 + c (g . u)) n - c (u . n) g. The sign of the determinant keeps the normal on its side of
// the surface if compression turns the mesh inside out.
void WaveDeformer::deform(const MeshGeometry& /*geometry*/, Surface& surface) const
{
    const MeshWave wave = meshWave(*this);
    for (std::size_t i = 0; i < surface.vertexCount(); ++i) {
        const Vector p = wide(surface.positions[i]);
        const Vector n = wide(surface.normals[i]);
        const double angle = dot(wave.gradient, p) + wave.start;
        const double c = std::cos(angle);
        const double volume = 1 + c * wave.stretch;
        const Vector turned = volume * n - c * dot(wave.displacement, n) * wave.gradient;
        surface.positions[i] = narrow(p + std::sin(angle) * wave.displacement);
        surface.normals[i] = narrow(normalised((volume < 0 ? -1 : 1) * turned));
    }
}

std::vector<DeformerParameter> WaveDeformer::parameters()
{
    return {
        {"amplitude", "height of the wave, in units of its space", &amplitude, -kLargestLength,
         kLargestLength},
        {"wavelength", "length of the wave, in units of its space", &wavelength, kShortestWave,
         kLargestLength},
        {"phase", "place of the wave, in radians", &phase, -kLargestPhase, kLargestPhase},
        {"direction", "axis along which the wave travels", &direction, 0, 0, {"x", "y", "z"}},
        {"displacement", "axis along which vertices move", &displacement, 0, 0, {"x", "y", "z"}}};
}

} // namespace vyra

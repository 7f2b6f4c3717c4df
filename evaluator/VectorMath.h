// Vectors and affine transforms in double precision, for the CPU sides of the deformers. Internal.
#pragma once

#include "evaluator/Geometry.h"

#include <array>
#include <cmath>
#include <cstddef>

namespace vyra {

struct Vector {
    double x = 0;
    double y = 0;
    double z = 0;

    Vector& operator+=(const Vector& v)
    {
        x += v.x;
        y += v.y;
        z += v.z;
        return *this;
    }
};

inline Vector operator+(const Vector& a, const Vector& b)
{
    return {a.x + b.x, a.y + b.y, a.z + b.z};
}

inline Vector operator-(const Vector& a, const Vector& b)
{
    return {a.x - b.x, a.y - b.y, a.z - b.z};
}

inline Vector operator*(double factor, const Vector& v)
{
    return {factor * v.x, factor * v.y, factor * v.z};
}

inline double dot(const Vector& a, const Vector& b)
{
    return a.x * b.x + a.y * b.y + a.z * b.z;
}

inline Vector cross(const Vector& a, const Vector& b)
{
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}

inline double length(const Vector& v)
{
    return std::sqrt(dot(v, v));
}

// Returns the vector with length 1, or `v` itself if its length is 0.
inline Vector normalised(const Vector& v)
{
    const double size = length(v);
    return size > 0 ? (1 / size) * v : v;
}

inline Vector wide(const Vector3& v)
{
    return {v.x, v.y, v.z};
}

inline Vector3 narrow(const Vector& v)
{
    return {static_cast<float>(v.x), static_cast<float>(v.y), static_cast<float>(v.z)};
}

// An affine transform by rows: `rows` are those of the linear part.
struct Affine {
    std::array<Vector, 3> rows;
    Vector offset;
};

inline Affine wide(const MatrixRows& m)
{
    return {{{{m[0], m[1], m[2]}, {m[4], m[5], m[6]}, {m[8], m[9], m[10]}}}, {m[3], m[7], m[11]}};
}

inline Vector transformVector(const Affine& m, const Vector& v)
{
    return {dot(m.rows[0], v), dot(m.rows[1], v), dot(m.rows[2], v)};
}

inline Vector transformPoint(const Affine& m, const Vector& p)
{
    return transformVector(m, p) + m.offset;
}

// Multiplies by the transposed linear part.
inline Vector transformTransposed(const Affine& m, const Vector& v)
{
    return v.x * m.rows[0] + v.y * m.rows[1] + v.z * m.rows[2];
}

// Returns the cofactors of the linear part, by rows: the transposed inverse times the determinant.
inline std::array<Vector, 3> cofactors(const Affine& m)
{
    return {cross(m.rows[1], m.rows[2]), cross(m.rows[2], m.rows[0]), cross(m.rows[0], m.rows[1])};
}

inline double determinant(const Affine& m)
{
    return dot(m.rows[0], cross(m.rows[1], m.rows[2]));
}

// Returns the inverse. The determinant must not be 0.
inline Affine inverse(const Affine& m)
{
    const std::array<Vector, 3> c = cofactors(m);
    const double factor = 1 / determinant(m);
    Affine result{{factor * Vector{c[0].x, c[1].x, c[2].x}, factor * Vector{c[0].y, c[1].y, c[2].y},
                   factor * Vector{c[0].z, c[1].z, c[2].z}},
                  {}};
    result.offset = -1 * transformVector(result, m.offset);
    return result;
}

// Returns whether the transform has an inverse: false if a number is not finite.
inline bool isInvertible(const Affine& m)
{
    const double factor = 1 / determinant(m);
    return std::isfinite(factor) && std::isfinite(determinant(m)) &&
           std::isfinite(length(m.offset));
}

} // namespace vyra

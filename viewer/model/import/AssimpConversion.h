// Conversions of single values from Assimp.
#pragma once

#include <cmath>
#include <cstddef>
#include <map>
#include <string>

#include <QMatrix4x4>
#include <QVector3D>
#include <assimp/matrix4x4.h>
#include <assimp/vector3.h>

namespace viewer {

// Indices into Model::nodes by name. Of several nodes with one name, it holds the first.
using NodeIndex = std::map<std::string, std::size_t>;

inline QVector3D toQt(const aiVector3D& vector)
{
    return {vector.x, vector.y, vector.z};
}

// Both types take their elements in row-major order.
inline QMatrix4x4 toQt(const aiMatrix4x4& matrix)
{
    return QMatrix4x4(&matrix.a1);
}

// Returns 0 for an infinite number and for NaN.
inline float finiteOrZero(float number)
{
    return std::isfinite(number) ? number : 0.0f;
}

inline QVector3D finiteOrZero(const aiVector3D& vector)
{
    return {finiteOrZero(vector.x), finiteOrZero(vector.y), finiteOrZero(vector.z)};
}

} // namespace viewer

// Serialises a model, or a failure, for another process of the same build.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"

#include <optional>

#include <QByteArray>

namespace viewer {

[[nodiscard]] QByteArray serialiseModel(Result<Model> model);

// Restores the argument of serialiseModel. Empty if `bytes` are truncated or not from
// serialiseModel.
[[nodiscard]] std::optional<Result<Model>> deserialiseModel(const QByteArray& bytes);

} // namespace viewer

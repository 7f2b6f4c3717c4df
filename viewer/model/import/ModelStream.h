// A model, or the reason why there is none, as bytes that another process of the same build reads.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"

#include <optional>

#include <QByteArray>

namespace viewer {

QByteArray toBytes(Result<Model> model);

// Empty if the bytes are not the whole of what toBytes wrote.
std::optional<Result<Model>> fromBytes(const QByteArray& bytes);

} // namespace viewer

#include "viewer/model/import/ModelSerialisation.h"

#include <algorithm>
#include <cstring>
#include <type_traits>
#include <utility>

namespace viewer {
namespace {

class Writer {
public:
    template <typename T>
    void plain(const T& value)
    {
        static_assert(std::is_trivially_copyable_v<T>);
        fBytes.append(reinterpret_cast<const char*>(&value), sizeof(T));
    }

    // Writes the size and the bytes of a vector or string of trivially copyable values.
    template <typename List>
    void plainList(const List& list)
    {
        using Value = typename List::value_type;
        static_assert(std::is_trivially_copyable_v<Value>);
        plain(list.size());
        constexpr qsizetype kValueBytes = sizeof(Value);
        fBytes.append(reinterpret_cast<const char*>(list.data()),
                      static_cast<qsizetype>(list.size()) * kValueBytes);
    }

    template <typename T, typename Transfer>
    void list(std::vector<T>& values, Transfer transfer)
    {
        plain(values.size());
        std::for_each(values.begin(), values.end(), transfer);
    }

    [[nodiscard]] QByteArray take() { return std::move(fBytes); }

private:
    QByteArray fBytes;
};

// Leaves values unchanged after the end of the bytes; finished() then returns false.
class Reader {
public:
    explicit Reader(const QByteArray& bytes) : fBytes(bytes) {}

    template <typename T>
    void plain(T& value)
    {
        if (sizeof(T) <= left())
            std::memcpy(static_cast<void*>(&value), take(sizeof(T)), sizeof(T));
        else
            fComplete = false;
    }

    template <typename List>
    void plainList(List& list)
    {
        using Value = typename List::value_type;
        const std::size_t size = count(sizeof(Value));
        list.resize(size);
        if (size > 0)
            std::memcpy(static_cast<void*>(list.data()), take(size * sizeof(Value)),
                        size * sizeof(Value));
    }

    template <typename T, typename Transfer>
    void list(std::vector<T>& values, Transfer transfer)
    {
        values.resize(count(1));
        std::for_each(values.begin(), values.end(), transfer);
    }

    // Returns whether all values were read and no bytes are left.
    [[nodiscard]] bool finished() const { return fComplete && left() == 0; }

private:
    std::size_t left() const { return static_cast<std::size_t>(fBytes.size()) - fNext; }

    const char* take(std::size_t size)
    {
        const char* bytes = fBytes.constData() + fNext;
        fNext += size;
        return bytes;
    }

    // Reads the size of a list whose elements take at least `elementBytes` each. Returns 0 if fewer
    // bytes are left.
    std::size_t count(std::size_t elementBytes)
    {
        std::size_t value = 0;
        plain(value);
        if (value <= left() / elementBytes)
            return value;
        fComplete = false;
        return 0;
    }

    const QByteArray& fBytes;
    std::size_t fNext = 0;
    bool fComplete = true;
};

// The layout, described once for both directions. Structures with padding are transferred member by
// member, which keeps uninitialised bytes out.

template <typename Stream>
void transferMesh(Stream& stream, Mesh& mesh)
{
    stream.plainList(mesh.name);
    stream.plain(mesh.node);
    stream.plain(mesh.colour);
    stream.plainList(mesh.positions);
    stream.plainList(mesh.normals);
    stream.plainList(mesh.boneIndices);
    stream.plainList(mesh.boneWeights);
    stream.plainList(mesh.triangles);
    stream.list(mesh.bones, [&stream](Bone& bone) {
        stream.plain(bone.node);
        stream.plain(bone.offset);
    });
    stream.list(mesh.morphTargets, [&stream](MorphTarget& target) {
        stream.plainList(target.positionDeltas);
        stream.plainList(target.normalDeltas);
        stream.plain(target.weight);
    });
}

template <typename Stream, typename T>
void transferKeys(Stream& stream, std::vector<Key<T>>& keys)
{
    stream.list(keys, [&stream](Key<T>& key) {
        stream.plain(key.seconds);
        stream.plain(key.value);
    });
}

template <typename Stream>
void transferModel(Stream& stream, Model& model)
{
    stream.list(model.nodes, [&stream](Node& node) {
        stream.plainList(node.name);
        stream.plain(node.parent);
        stream.plain(node.local);
    });
    stream.list(model.meshes, [&stream](Mesh& mesh) { transferMesh(stream, mesh); });
    stream.list(model.animations, [&stream](Animation& animation) {
        stream.plainList(animation.name);
        stream.plain(animation.seconds);
        stream.list(animation.channels, [&stream](Channel& channel) {
            stream.plain(channel.node);
            transferKeys(stream, channel.positions);
            transferKeys(stream, channel.rotations);
            transferKeys(stream, channel.scales);
        });
        stream.list(animation.morphChannels, [&stream](MorphChannel& channel) {
            stream.plain(channel.node);
            stream.list(channel.weights, [&stream](Key<std::vector<float>>& key) {
                stream.plain(key.seconds);
                stream.plainList(key.value);
            });
        });
    });
}

} // namespace

QByteArray serialiseModel(Result<Model> model)
{
    Writer writer;
    writer.plain(model ? ExitCode::kSuccess : model.failure().code);
    if (model)
        transferModel(writer, model.value());
    else
        writer.plainList(model.failure().text);
    return writer.take();
}

std::optional<Result<Model>> deserialiseModel(const QByteArray& bytes)
{
    Reader reader(bytes);
    auto code = ExitCode::kModel;
    reader.plain(code);
    Result<Model> result = Model();
    if (code == ExitCode::kSuccess) {
        transferModel(reader, result.value());
    } else {
        Failure failure{code, {}};
        reader.plainList(failure.text);
        result = failure;
    }
    return reader.finished() ? std::optional(std::move(result)) : std::nullopt;
}

} // namespace viewer

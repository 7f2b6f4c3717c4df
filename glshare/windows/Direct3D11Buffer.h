// What is done on the Direct3D 11 side: reading and writing a buffer through one of our own that
// the processor can map.
#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <span>

#include <d3d11.h>

namespace glshare {

struct ComRelease {
    void operator()(IUnknown* object) const { object->Release(); }
};
template <typename T>
using ComPointer = std::unique_ptr<T, ComRelease>;

// Uses the device's immediate context, which is made safe for several threads.
class Direct3D11Buffer {
public:
    // Holds a reference to `resource`. Empty if that is null, of another device, or of a kind that
    // cannot be copied to.
    static std::optional<Direct3D11Buffer> create(ID3D11Device* device, ID3D11Buffer* resource);

    [[nodiscard]] std::size_t size() const { return fSize; }

    // All bytes of the buffer; false if Direct3D fails.
    [[nodiscard]] bool read(std::span<std::byte> to);
    [[nodiscard]] bool write(std::span<const std::byte> from);

private:
    ComPointer<ID3D11Buffer> fResource;
    ComPointer<ID3D11Buffer> fStaging;
    ComPointer<ID3D11DeviceContext> fCommands;
    std::size_t fSize = 0;
};

} // namespace glshare

// Reads and writes a Direct3D 11 buffer through a staging buffer that the CPU can map.
#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <span>

#include <d3d11.h>

namespace glshare {

struct ComRelease {
    void operator()(IUnknown* object) const noexcept { object->Release(); }
};
template <typename T>
using ComPointer = std::unique_ptr<T, ComRelease>;

// Uses the device's immediate context, for which it enables multithread protection. One thread at a
// time.
class Direct3D11Buffer {
public:
    // Holds a reference to `resource`. Empty if that is null, immutable or of another device.
    [[nodiscard]] static std::optional<Direct3D11Buffer> create(ID3D11Device* device,
                                                                ID3D11Buffer* resource);

    [[nodiscard]] std::size_t size() const noexcept { return fSize; }

    // Copy all bytes of the buffer; return false if Direct3D fails. The span has size() bytes.
    [[nodiscard]] bool read(std::span<std::byte> to);
    [[nodiscard]] bool write(std::span<const std::byte> from);

private:
    ComPointer<ID3D11Buffer> fResource;
    ComPointer<ID3D11Buffer> fStaging;
    ComPointer<ID3D11DeviceContext> fCommands;
    std::size_t fSize = 0;
};

} // namespace glshare

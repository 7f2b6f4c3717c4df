#include "windows/Direct3D11Buffer.h"

#include <cstring>
#include <utility>

#include <d3d11_4.h>

namespace glshare {

namespace {

void enableMultithreadProtection(ID3D11DeviceContext* commands)
{
    ID3D11Multithread* threads = nullptr;
    if (SUCCEEDED(commands->QueryInterface(__uuidof(ID3D11Multithread),
                                           reinterpret_cast<void**>(&threads)))) {
        threads->SetMultithreadProtected(TRUE);
        threads->Release();
    }
}

} // namespace

std::optional<Direct3D11Buffer> Direct3D11Buffer::create(ID3D11Device* device,
                                                         ID3D11Buffer* resource)
{
    if (resource == nullptr)
        return std::nullopt;
    ID3D11Device* owner = nullptr;
    resource->GetDevice(&owner);
    const ComPointer<ID3D11Device> ownerReference(owner);
    D3D11_BUFFER_DESC description{};
    resource->GetDesc(&description);
    if (owner != device || description.Usage == D3D11_USAGE_IMMUTABLE)
        return std::nullopt;

    Direct3D11Buffer buffer;
    buffer.fSize = description.ByteWidth;
    D3D11_BUFFER_DESC wanted{};
    wanted.ByteWidth = description.ByteWidth;
    wanted.Usage = D3D11_USAGE_STAGING;
    wanted.CPUAccessFlags = D3D11_CPU_ACCESS_READ | D3D11_CPU_ACCESS_WRITE;
    ID3D11Buffer* staging = nullptr;
    if (FAILED(device->CreateBuffer(&wanted, nullptr, &staging)))
        return std::nullopt;
    buffer.fStaging.reset(staging);
    ID3D11DeviceContext* commands = nullptr;
    device->GetImmediateContext(&commands);
    buffer.fCommands.reset(commands);
    enableMultithreadProtection(commands);
    resource->AddRef();
    buffer.fResource.reset(resource);
    return buffer;
}

// Map waits for the copy.
bool Direct3D11Buffer::read(std::span<std::byte> to)
{
    fCommands->CopyResource(fStaging.get(), fResource.get());
    D3D11_MAPPED_SUBRESOURCE mapped{};
    if (FAILED(fCommands->Map(fStaging.get(), 0, D3D11_MAP_READ, 0, &mapped)))
        return false;
    std::memcpy(to.data(), mapped.pData, to.size());
    fCommands->Unmap(fStaging.get(), 0);
    return true;
}

bool Direct3D11Buffer::write(std::span<const std::byte> from)
{
    D3D11_MAPPED_SUBRESOURCE mapped{};
    if (FAILED(fCommands->Map(fStaging.get(), 0, D3D11_MAP_WRITE, 0, &mapped)))
        return false;
    std::memcpy(mapped.pData, from.data(), from.size());
    fCommands->Unmap(fStaging.get(), 0);
    fCommands->CopyResource(fResource.get(), fStaging.get());
    return true;
}

} // namespace glshare

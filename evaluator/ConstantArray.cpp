#include "evaluator/ConstantArray.h"

#include "evaluator/ConstantStorage.h"

#include "runtime/TopenCLInfo.h"

namespace vyra {

ConstantArray::ConstantArray(const void* bytes, std::size_t sizeInBytes)
    : fStorage(sizeInBytes ? std::make_shared<ConstantStorage>(bytes, sizeInBytes) : nullptr)
{
}

std::size_t ConstantArray::sizeInBytes() const
{
    return fStorage ? fStorage->bytes().size() : 0;
}

const void* ConstantArray::data() const
{
    return fStorage ? fStorage->bytes().data() : nullptr;
}

ConstantStorage::ConstantStorage(const void* bytes, std::size_t sizeInBytes)
    : fBytes(static_cast<const std::byte*>(bytes),
             static_cast<const std::byte*>(bytes) + sizeInBytes)
{
}

cl_mem ConstantStorage::memory(cl_int& status)
{
    status = CL_SUCCESS;
    if (cl_mem created = fMemory.load(std::memory_order_acquire))
        return created;

    const std::scoped_lock lock(fCreation);
    if (cl_mem created = fMemory.load(std::memory_order_relaxed))
        return created;
    // Memory that is created from host bytes needs no command, so every queue may read it at once.
    fBuffer.emplace(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_ONLY, fBytes.size(),
                    fBytes.data(), &status);
    if (status != CL_SUCCESS) {
        fBuffer.reset();
        return nullptr;
    }
    fMemory.store(fBuffer->buffer().get(), std::memory_order_release);
    return fBuffer->buffer().get();
}

} // namespace vyra

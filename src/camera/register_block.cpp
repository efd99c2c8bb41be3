#include "camera/register_block.h"

#include <new>
#include <utility>

namespace ZV {

RegisterCopy::RegisterCopy(std::uint32_t newLength,
                           std::unique_ptr<std::atomic<std::uint32_t>[]> words)
    : length(newLength), quadlets(std::move(words)) {}

std::unique_ptr<RegisterCopy> RegisterCopy::Make(std::uint32_t length) {
    std::unique_ptr<std::atomic<std::uint32_t>[]> words(new (std::nothrow)
                                                            std::atomic<std::uint32_t>[length]);
    if (words == nullptr) return nullptr;
    std::unique_ptr<RegisterCopy> made(new (std::nothrow) RegisterCopy(length, std::move(words)));
    if (made != nullptr) made->StoreZeros();
    return made;
}

void RegisterCopy::StoreZeros() {
    for (std::uint32_t quadlet = 0; quadlet < length; ++quadlet) Store(quadlet, 0);
}

RegisterCopy* RegisterBlock::Provide(std::uint32_t length) {
    const std::lock_guard hold(leafMutex);
    RegisterCopy* provided = FindOrMake(length);
    if (provided != nullptr) copy.store(provided, std::memory_order_release);
    return provided;
}

RegisterCopy* RegisterBlock::FindOrMake(std::uint32_t length) {
    for (RegisterCopy* known = copies.get(); known != nullptr; known = known->next.get()) {
        if (known->length == length) return known;
    }
    std::unique_ptr<RegisterCopy> made = RegisterCopy::Make(length);
    if (made == nullptr) return nullptr;
    made->next = std::move(copies);
    copies = std::move(made);
    return copies.get();
}

std::uint32_t RegisterBlock::GetLength() const {
    const RegisterCopy* present = copy.load(std::memory_order_acquire);
    return present != nullptr ? present->GetLength() : 0;
}

}  // namespace ZV

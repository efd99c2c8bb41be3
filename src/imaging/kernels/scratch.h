#pragma once

#include <cstddef>
#include <cstdlib>
#include <memory>
#include <type_traits>

namespace ZV {

struct ScratchReleaser {
    void operator()(void* items) const { std::free(items); }
};

/// Scratch of one call, from the C allocator.
template <typename Item>
using Scratch = std::unique_ptr<Item[], ScratchReleaser>;

/// `count` items, above 0, that hold anything; null without memory. Reentrant.
template <typename Item>
[[nodiscard]] Scratch<Item> MakeScratch(std::size_t count) {
    static_assert(std::is_trivially_default_constructible_v<Item> &&
                  std::is_trivially_destructible_v<Item>);
    return Scratch<Item>(static_cast<Item*>(std::malloc(count * sizeof(Item))));
}

}  // namespace ZV

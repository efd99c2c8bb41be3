#include "fuzz/client_calls.h"

#include <array>
#include <memory>

namespace ZV::Fuzzing {
namespace {

constexpr std::uint32_t ResultLast = zerrRoiTooSmall;
constexpr std::uint32_t WordKeys = 47, SignedKeys = 3, WideKeys = 4;
constexpr std::int32_t TableRoomMax = 64;

using WordReader = ZentaraResult (*)(Zentara_Settings*, std::uint32_t, std::uint32_t*);
using SignedReader = ZentaraResult (*)(Zentara_Settings*, std::uint32_t, std::int32_t*);
using WideReader = ZentaraResult (*)(Zentara_Settings*, std::uint32_t, std::uint64_t*);
using BlockQuestion = ZentaraResult (*)(Zentara_Settings*, std::uint32_t);
using CameraQuestion = ZentaraResult (*)(ZentaraHandle, std::uint32_t);

constexpr std::array<WordReader, 3> WordReaders{Zentara_GetParam, Zentara_GetParamMin,
                                                Zentara_GetParamMax};
constexpr std::array<SignedReader, 3> SignedReaders{Zentara_GetParamS32, Zentara_GetParamS32Min,
                                                    Zentara_GetParamS32Max};
constexpr std::array<WideReader, 3> WideReaders{Zentara_GetParam64, Zentara_GetParam64Min,
                                                Zentara_GetParam64Max};
constexpr std::array<BlockQuestion, 6> BlockQuestions{
    Zentara_IsRangeTable,  Zentara_IsRangeTableS32,  Zentara_IsRangeTable64,
    Zentara_IsSparseTable, Zentara_IsSparseTableS32, Zentara_IsSparseTable64};
constexpr std::array<CameraQuestion, 3> CameraQuestions{
    Zentara_IsParamSupported, Zentara_IsParamS32Supported, Zentara_IsParam64Supported};

template <typename Readers, typename Value>
void ReadAll(const Readers& readers, Zentara_Settings* block, std::uint32_t key, Value value) {
    for (const auto reader : readers) RequireKnownResult(reader(block, key, &value));
}

/// The table is as long as it is said to be, so that an entry too many is found.
template <typename Entry>
void ReadTable(ZentaraResult (*read)(Zentara_Settings*, std::uint32_t, Entry*, std::int32_t*),
               Zentara_Settings* block, std::uint32_t key, std::int32_t room) {
    const std::size_t held = room > 0 ? static_cast<std::size_t>(room) : 0;
    const auto table = std::make_unique<Entry[]>(held);
    std::int32_t size = room;
    RequireKnownResult(read(block, key, table.get(), &size));
    Require(size <= room || size == 0);
}

void ReadTables(Zentara_Settings* block, std::uint32_t key, std::int32_t room) {
    ReadTable(Zentara_GetParamSparseTable, block, key, room);
    ReadTable(Zentara_GetParamSparseTableS32, block, key, room);
    ReadTable(Zentara_GetParamSparseTable64, block, key, room);
}

void AskAll(ZentaraHandle handle, Zentara_Settings* block, std::uint32_t key) {
    for (const BlockQuestion ask : BlockQuestions) RequireKnownResult(ask(block, key));
    for (const CameraQuestion ask : CameraQuestions) RequireKnownResult(ask(handle, key));
}

/// A byte names a key of the interface, or one beyond; the last takes a whole word.
std::uint32_t TakeKey(FuzzInput& input) {
    constexpr std::uint8_t WholeWord = 0xFF;
    const std::uint8_t key = input.TakeByte();
    return key == WholeWord ? input.TakeWord() : key;
}

void ReadWordKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    ReadAll(WordReaders, block, TakeKey(input), std::uint32_t{0});
}
void ReadSignedKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    ReadAll(SignedReaders, block, TakeKey(input), std::int32_t{0});
}
void ReadWideKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    ReadAll(WideReaders, block, TakeKey(input), std::uint64_t{0});
}
void AskKey(FuzzInput& input, ZentaraHandle handle, Zentara_Settings* block) {
    AskAll(handle, block, TakeKey(input));
}
void ReadKeyTables(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    const std::uint32_t key = TakeKey(input);
    ReadTables(block, key, static_cast<std::int8_t>(input.TakeByte()));
}
void SetWordKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    const std::uint32_t key = TakeKey(input);
    RequireKnownResult(Zentara_SetParam(block, key, input.TakeWord()));
}
void SetSignedKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    const std::uint32_t key = TakeKey(input);
    RequireKnownResult(Zentara_SetParamS32(block, key, input.Take<std::int32_t>()));
}
void SetWideKey(FuzzInput& input, ZentaraHandle, Zentara_Settings* block) {
    const std::uint32_t key = TakeKey(input);
    RequireKnownResult(Zentara_SetParam64(block, key, input.TakeWide()));
}

using AccessorCall = void (*)(FuzzInput&, ZentaraHandle, Zentara_Settings*);
constexpr std::array<AccessorCall, 8> AccessorCalls{ReadWordKey,  ReadSignedKey, ReadWideKey,
                                                    AskKey,       ReadKeyTables, SetWordKey,
                                                    SetSignedKey, SetWideKey};

}  // namespace

void RequireKnownResult(ZentaraResult result) {
    Require(result <= ResultLast);
}

void CallAccessor(FuzzInput& input, ZentaraHandle handle, Zentara_Settings* block) {
    AccessorCalls[input.TakeByte() % AccessorCalls.size()](input, handle, block);
}

void ReadWholeBlock(ZentaraHandle handle, Zentara_Settings* block) {
    for (std::uint32_t key = 0; key <= WordKeys; ++key) {
        ReadAll(WordReaders, block, key, std::uint32_t{0});
        AskAll(handle, block, key);
        ReadTables(block, key, TableRoomMax);
    }
    for (std::uint32_t key = 0; key <= SignedKeys; ++key) {
        ReadAll(SignedReaders, block, key, std::int32_t{0});
    }
    for (std::uint32_t key = 0; key <= WideKeys; ++key) {
        ReadAll(WideReaders, block, key, std::uint64_t{0});
    }
}

}  // namespace ZV::Fuzzing

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <optional>
#include <string>

#include "support/flat_camera.h"
#include "support/settings_words.h"

// Every function of the settings block, its parameters, the capability tables and the information,
// with every argument that can be wrong: the code, and that neither the 260 bytes of the block nor
// what the out arguments point at changes, nor a byte around them.
namespace ZV::Test {
namespace {

constexpr std::uint8_t Guard = 0xDD;

/// Memory of a client with guard bytes on both sides.
template <std::size_t Bytes>
class Guarded {
  public:
    Guarded() { memory.fill(Guard); }

    void* Get() { return memory.data() + Margin; }
    bool AreGuardsIntact() const {
        return IsFilled(0, Margin) && IsFilled(Margin + Bytes, memory.size());
    }
    bool IsUntouched() const { return IsFilled(0, memory.size()); }

  private:
    static constexpr std::size_t Margin = 64;

    bool IsFilled(std::size_t from, std::size_t to) const {
        for (std::size_t i = from; i < to; ++i) {
            if (memory[i] != Guard) return false;
        }
        return true;
    }

    alignas(8) std::array<std::uint8_t, Margin + Bytes + Margin> memory;
};

/// What a call is given; each function takes of it what it has an argument for.
struct Arguments {
    ZentaraHandle handle = 0;
    Zentara_Settings* block = nullptr;
    std::uint32_t key = 0;
    void* out = nullptr;  ///< Room for 100 values of 8 bytes, and the length of a text.
    std::int32_t* size = nullptr;
};

constexpr std::int32_t Room = 100;

template <typename Value>
ZentaraResult Invoke(ZentaraResult (*function)(Zentara_Settings*, std::uint32_t, Value*),
                     const Arguments& given) {
    return function(given.block, given.key, static_cast<Value*>(given.out));
}
template <typename Value>
requires std::is_integral_v<Value> ZentaraResult
Invoke(ZentaraResult (*function)(Zentara_Settings*, std::uint32_t, Value), const Arguments& given) {
    return function(given.block, given.key, Value{20000});
}
template <typename Value>
ZentaraResult Invoke(ZentaraResult (*function)(Zentara_Settings*, std::uint32_t, Value*,
                                               std::int32_t*),
                     const Arguments& given) {
    return function(given.block, given.key, static_cast<Value*>(given.out), given.size);
}
ZentaraResult Invoke(ZentaraResult (*function)(Zentara_Settings*, std::uint32_t),
                     const Arguments& given) {
    return function(given.block, given.key);
}
ZentaraResult Invoke(ZentaraResult (*function)(ZentaraHandle, std::uint32_t),
                     const Arguments& given) {
    return function(given.handle, given.key);
}
ZentaraResult Invoke(ZentaraResult (*function)(ZentaraHandle, Zentara_Settings*),
                     const Arguments& given) {
    return function(given.handle, given.block);
}
ZentaraResult Invoke(ZentaraResult (*function)(ZentaraHandle, std::uint32_t, std::uint32_t*),
                     const Arguments& given) {
    return function(given.handle, given.key, static_cast<std::uint32_t*>(given.out));
}
ZentaraResult Invoke(ZentaraResult (*function)(ZentaraHandle, char*, std::uint32_t),
                     const Arguments& given) {
    return function(given.handle, static_cast<char*>(given.out), Room);
}

template <auto Function>
ZentaraResult Call(const Arguments& given) {
    return Invoke(Function, given);
}

constexpr ZentaraResult None = zerrNone;
constexpr ZentaraResult No = zerrNotSupported;
constexpr ZentaraResult Parameter = zerrBadParameter;
constexpr ZentaraResult Settings = zerrBadSettings;
constexpr ZentaraResult Handle = zerrBadHandle;
constexpr std::uint32_t NoKeys = 0xFFFFFFFF;  ///< The function takes no key.

/// What a function writes beside its out argument.
enum class Writes {
    Nothing,
    Block,       ///< When it succeeds.
    ListSize,    ///< The size, when it succeeds.
    SizeOfZero,  ///< The size, although it refuses.
};

/// The codes of one function, by what is wrong.
struct Row {
    const char* name;
    ZentaraResult (*call)(const Arguments& given);
    std::uint32_t key;             ///< One that the camera has.
    std::uint32_t unsupportedKey;  ///< One that it does not have.
    std::uint32_t keyCount;
    ZentaraResult nothing;  ///< Every argument null or 0.
    ZentaraResult nullHandle, nullBlock, nullOut, nullSize;
    ZentaraResult wrongMagic;
    ZentaraResult closed;  ///< Also for a stale handle and one that was never given.
    ZentaraResult held;    ///< Open in another process.
    Writes writes = Writes::Nothing;
};

// A null handle is that of the block where a function takes no other.
constexpr Row Rows[] = {
    {"ReadSettingsFromCam", Call<Zentara_ReadSettingsFromCam>, 0, 0, NoKeys, Handle, Handle,
     Parameter, None, None, None, Handle, Handle, Writes::Block},
    {"ReadDefaultSettings", Call<Zentara_ReadDefaultSettings>, 0, 0, NoKeys, Handle, Handle,
     Parameter, None, None, None, Handle, Handle, Writes::Block},
    {"TranslateSettings", Call<Zentara_TranslateSettings>, 0, 0, NoKeys, No, No, No, No, No, No, No,
     No},
    {"PreflightSettings", Call<Zentara_PreflightSettings>, 0, 0, NoKeys, Handle, Handle, Parameter,
     None, None, Settings, Handle, Handle, Writes::Block},
    {"SendSettingsToCam", Call<Zentara_SendSettingsToCam>, 0, 0, NoKeys, Handle, Handle, Settings,
     None, None, Settings, Handle, Handle, Writes::Block},

    {"GetParam", Call<Zentara_GetParam>, 15, 18, 47, Parameter, Settings, Parameter, Parameter,
     None, Settings, Settings, None},
    {"GetParamMin", Call<Zentara_GetParamMin>, 15, 18, 47, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"GetParamMax", Call<Zentara_GetParamMax>, 15, 18, 47, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"GetParamS32", Call<Zentara_GetParamS32>, 1, 2, 3, Parameter, Settings, Parameter, Parameter,
     None, Settings, Settings, None},
    {"GetParamS32Min", Call<Zentara_GetParamS32Min>, 1, 2, 3, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"GetParamS32Max", Call<Zentara_GetParamS32Max>, 1, 2, 3, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"GetParam64", Call<Zentara_GetParam64>, 0, 3, 4, Parameter, Settings, Parameter, Parameter,
     None, Settings, Settings, None},
    {"GetParam64Min", Call<Zentara_GetParam64Min>, 0, 3, 4, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"GetParam64Max", Call<Zentara_GetParam64Max>, 0, 3, 4, Parameter, Settings, Parameter,
     Parameter, None, Settings, Settings, None},
    {"SetParam", Call<Zentara_SetParam>, 15, 18, 47, Parameter, Settings, Parameter, None, None,
     Settings, Settings, None, Writes::Block},
    {"SetParamS32", Call<Zentara_SetParamS32>, 1, 2, 3, Parameter, Settings, Parameter, None, None,
     Settings, Settings, None, Writes::Block},
    {"SetParam64", Call<Zentara_SetParam64>, 0, 3, 4, Parameter, Settings, Parameter, None, None,
     Settings, Settings, None, Writes::Block},

    {"IsParamSupported", Call<Zentara_IsParamSupported>, 15, 18, 47, Handle, Handle, None, None,
     None, None, Handle, Handle},
    {"IsParamS32Supported", Call<Zentara_IsParamS32Supported>, 1, 2, 3, Handle, Handle, None, None,
     None, None, Handle, Handle},
    {"IsParam64Supported", Call<Zentara_IsParam64Supported>, 0, 3, 4, Handle, Handle, None, None,
     None, None, Handle, Handle},
    // Kept: a camera that is not open, or not ours, is no 1, so the table alone decides.
    {"IsRangeTable", Call<Zentara_IsRangeTable>, 15, 18, 47, Parameter, None, Parameter, None, None,
     Settings, None, None},
    {"IsRangeTableS32", Call<Zentara_IsRangeTableS32>, 1, 2, 3, Parameter, None, Parameter, None,
     None, Settings, None, None},
    {"IsRangeTable64", Call<Zentara_IsRangeTable64>, 0, 3, 4, Parameter, None, Parameter, None,
     None, Settings, None, None},
    {"IsSparseTable", Call<Zentara_IsSparseTable>, 12, 18, 47, Parameter, None, Parameter, None,
     None, Settings, None, None},
    {"IsSparseTableS32", Call<Zentara_IsSparseTableS32>, 1, 2, 3, No, No, No, No, No, No, No, No},
    {"IsSparseTable64", Call<Zentara_IsSparseTable64>, 0, 3, 4, No, No, No, No, No, No, No, No},
    {"GetParamSparseTable", Call<Zentara_GetParamSparseTable>, 12, 18, 47, Parameter, Settings,
     Parameter, Parameter, Parameter, Settings, Settings, None, Writes::ListSize},
    {"GetParamSparseTableS32", Call<Zentara_GetParamSparseTableS32>, 1, 2, 3, No, No, No, No, No,
     No, No, No, Writes::SizeOfZero},
    {"GetParamSparseTable64", Call<Zentara_GetParamSparseTable64>, 0, 3, 4, No, No, No, No, No, No,
     No, No, Writes::SizeOfZero},

    {"GetInfo", Call<Zentara_GetInfo>, 5, 17, NoKeys, Handle, Handle, None, Parameter, None, None,
     Handle, Handle},
    {"GetSerialString", Call<Zentara_GetSerialString>, 0, 0, NoKeys, Handle, Handle, None,
     Parameter, None, None, Handle, Handle},
    {"GetCameraModelString", Call<Zentara_GetCameraModelString>, 0, 0, NoKeys, Handle, Handle, None,
     Parameter, None, None, Handle, Handle},
};

const Row& GetListRow() {
    return *std::find_if(std::begin(Rows), std::end(Rows), [](const Row& candidate) {
        return candidate.call == Call<Zentara_GetParamSparseTable>;
    });
}

/// One call with good arguments that a test spoils before it is made.
class GuardedCall {
  public:
    GuardedCall(const Row& ofRow, const Zentara_Settings& contents)
        : given{GetHandleOf(contents), static_cast<Zentara_Settings*>(block.Get()), ofRow.key,
                out.Get(), static_cast<std::int32_t*>(size.Get())},
          row(ofRow) {
        std::memcpy(given.block, &contents, sizeof(contents));
        std::memcpy(given.size, &Room, sizeof(Room));
    }
    GuardedCall(const GuardedCall&) = delete;
    GuardedCall& operator=(const GuardedCall&) = delete;

    Zentara_Settings& GetBlock() { return *static_cast<Zentara_Settings*>(block.Get()); }
    std::int32_t GetSize() { return *static_cast<std::int32_t*>(size.Get()); }
    void SetSize(std::int32_t value) { *static_cast<std::int32_t*>(size.Get()) = value; }
    void SetHandle(ZentaraHandle handle) {
        given.handle = handle;
        SetHandleOf(GetBlock(), handle);
    }
    bool IsOutUntouched() const { return out.IsUntouched(); }
    bool AreGuardsIntact() const {
        return block.AreGuardsIntact() && out.AreGuardsIntact() && size.AreGuardsIntact();
    }

    /// A refusal touches nothing, nor does a success touch what the row does not say; `size` may
    /// become 0 where the function says so.
    void Expect(ZentaraResult expected, const std::string& circumstance) {
        const Zentara_Settings before = GetBlock();
        const std::int32_t sizeBefore = GetSize();

        EXPECT_ZERR(expected, row.call(given)) << row.name << ": " << circumstance;

        EXPECT_TRUE(AreGuardsIntact()) << row.name << ": " << circumstance;
        const bool succeeds = expected == zerrNone;
        if (!succeeds || row.writes != Writes::Block) {
            EXPECT_TRUE(AreSameBytes(before, GetBlock())) << row.name << ": " << circumstance;
        }
        if (!succeeds) {
            EXPECT_TRUE(out.IsUntouched()) << row.name << ": " << circumstance;
        }
        if (succeeds && row.writes == Writes::ListSize) return;
        const bool isZeroed =
            row.writes == Writes::SizeOfZero && given.size != nullptr && expected != zerrNotLoaded;
        EXPECT_EQ(isZeroed ? 0 : sizeBefore, GetSize()) << row.name << ": " << circumstance;
    }

  private:
    Guarded<sizeof(Zentara_Settings)> block;
    Guarded<Room * sizeof(std::uint64_t)> out;
    Guarded<sizeof(std::int32_t)> size;

  public:
    Arguments given;

  private:
    const Row& row;
};

/// Neither cooled nor with a wheel or an intensifier, so that each family misses a key.
constexpr std::string_view World = SmallColour;

class SettingsBadInput : public OpenedCamera {
  protected:
    explicit SettingsBadInput(std::string_view scenario = World) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        block = ReadSettings();
    }

    void ExpectOfAll(ZentaraResult Row::*code, const std::string& circumstance,
                     void (*spoil)(GuardedCall& call)) {
        for (const Row& row : Rows) {
            GuardedCall call(row, block);
            spoil(call);
            call.Expect(row.*code, circumstance);
        }
    }
    void ExpectOfHandle(ZentaraResult Row::*code, const std::string& circumstance,
                        ZentaraHandle spoiled) {
        for (const Row& row : Rows) {
            GuardedCall call(row, block);
            call.SetHandle(spoiled);
            call.Expect(row.*code, circumstance);
        }
    }

    Zentara_Settings block{};
};

TEST_F(SettingsBadInput, GoodArgumentsSucceedEverywhereButWhereNothingIsEverSupported) {
    for (const Row& row : Rows) {
        GuardedCall call(row, block);
        call.Expect(row.nothing == No ? No : None, "good arguments");
    }
}

TEST_F(SettingsBadInput, WithoutTheLibraryEveryFunctionSaysSoAndLooksAtNothing) {
    Zentara_ReleaseDriver();
    for (const Row& row : Rows) {
        GuardedCall call(row, block);
        call.Expect(zerrNotLoaded, "not loaded");
        call.given = {};
        call.Expect(zerrNotLoaded, "not loaded and no arguments");
    }
}

TEST_F(SettingsBadInput, NoArgumentsAtAllAreRefusedByTheFirstTest) {
    ExpectOfAll(&Row::nothing, "nothing", [](GuardedCall& call) { call.given = {}; });
}

TEST_F(SettingsBadInput, ANullHandleIsRefusedAlsoInsideABlock) {
    ExpectOfHandle(&Row::nullHandle, "null handle", 0);
}

TEST_F(SettingsBadInput, ANullBlockIsRefused) {
    ExpectOfAll(&Row::nullBlock, "null block",
                [](GuardedCall& call) { call.given.block = nullptr; });
}

TEST_F(SettingsBadInput, ANullOutPointerIsRefused) {
    ExpectOfAll(&Row::nullOut, "null out", [](GuardedCall& call) { call.given.out = nullptr; });
}

TEST_F(SettingsBadInput, ANullSizeIsRefused) {
    ExpectOfAll(&Row::nullSize, "null size", [](GuardedCall& call) { call.given.size = nullptr; });
}

TEST_F(SettingsBadInput, AWrongMagicNumberIsRefusedWhereItIsTested) {
    ExpectOfAll(&Row::wrongMagic, "magic 0",
                [](GuardedCall& call) { call.GetBlock().privateWords[SettingsMagicWord] = 0; });
    ExpectOfAll(&Row::wrongMagic, "one wrong bit",
                [](GuardedCall& call) { call.GetBlock().privateWords[SettingsMagicWord] ^= 1; });
}

// Two faults at once: the one that is tested first is told.
TEST_F(SettingsBadInput, ANullOutPointerIsToldBeforeAWrongMagicNumber) {
    for (const Row& row : Rows) {
        GuardedCall call(row, block);
        call.given.out = nullptr;
        call.GetBlock().privateWords[SettingsMagicWord] = 0;
        call.Expect(row.nullOut != None ? row.nullOut : row.wrongMagic, "null out, wrong magic");
    }
}

TEST_F(SettingsBadInput, AWrongMagicNumberIsToldBeforeAKeyBeyondTheFamilysLimit) {
    for (const Row& row : Rows) {
        if (row.keyCount == NoKeys) continue;
        GuardedCall call(row, block);
        call.given.key = row.keyCount;
        call.GetBlock().privateWords[SettingsMagicWord] = 0;
        call.Expect(row.wrongMagic != None ? row.wrongMagic : No, "wrong magic, key beyond");
    }
}

// The size is written and never compared.
TEST_F(SettingsBadInput, ASizeOfTheBlockThatIsWrongIsNoFault) {
    for (const std::uint32_t size : {0u, 1u, 0xFFFFFFFFu}) {
        for (const Row& row : Rows) {
            GuardedCall call(row, block);
            call.GetBlock().size = size;
            call.Expect(row.nothing == No ? No : None, "size field");
        }
    }
}

TEST_F(SettingsBadInput, AKeyAtAndBeyondTheFamilysLimitIsNotSupported) {
    for (const Row& row : Rows) {
        if (row.keyCount == NoKeys) continue;
        for (const std::uint32_t key : {row.keyCount, row.keyCount + 1, 1000u, 0x7FFFFFFFu,
                                        0x80000000u, 0xFFFFFFFEu, 0xFFFFFFFFu}) {
            GuardedCall call(row, block);
            call.given.key = key;
            call.Expect(No, "key " + std::to_string(key));
        }
    }
}

TEST_F(SettingsBadInput, AKeyThatTheCameraDoesNotHaveIsNotSupported) {
    for (const Row& row : Rows) {
        if (row.key == row.unsupportedKey) continue;
        GuardedCall call(row, block);
        call.given.key = row.unsupportedKey;
        call.Expect(No, "unsupported key");
    }
}

TEST_F(SettingsBadInput, AnInformationKeyWithoutAnAnswerSetsTheValueToZeroAndNothingElse) {
    testing::internal::CaptureStdout();
    for (const std::uint32_t key : {27u, 28u, 35u, 41u, 42u, 0x80000000u, 0xFFFFFFFFu}) {
        Guarded<4> value;
        EXPECT_ZERR(No, Zentara_GetInfo(handle, key, static_cast<std::uint32_t*>(value.Get())));
        EXPECT_EQ(0u, *static_cast<std::uint32_t*>(value.Get())) << key;
        EXPECT_TRUE(value.AreGuardsIntact()) << key;
    }
    (void)testing::internal::GetCapturedStdout();
}

TEST_F(SettingsBadInput, ABlockOrTableThatIsWrongIsToldBeforeARoomOfZeroOrLess) {
    for (const std::int32_t size : {0, -1}) {
        GuardedCall noBlock(GetListRow(), block);
        noBlock.SetSize(size);
        noBlock.given.block = nullptr;
        noBlock.Expect(Parameter, "null block, size " + std::to_string(size));

        GuardedCall noTable(GetListRow(), block);
        noTable.SetSize(size);
        noTable.given.out = nullptr;
        noTable.Expect(Parameter, "null table, size " + std::to_string(size));

        GuardedCall noMagic(GetListRow(), block);
        noMagic.SetSize(size);
        noMagic.GetBlock().privateWords[SettingsMagicWord] = 0;
        noMagic.Expect(Settings, "wrong magic, size " + std::to_string(size));
    }
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    for (const std::int32_t size : {0, -1}) {
        GuardedCall closed(GetListRow(), block);
        closed.SetSize(size);
        closed.Expect(Settings, "closed, size " + std::to_string(size));
    }
}

TEST_F(SettingsBadInput, ARoomForAListOfZeroOrLessIsAnsweredWithoutAnEntry) {
    for (const std::int32_t size : {0, -1, INT32_MIN}) {
        GuardedCall call(GetListRow(), block);
        call.SetSize(size);
        call.Expect(size == 0 ? None : No, "size " + std::to_string(size));
        EXPECT_TRUE(call.IsOutUntouched()) << size;
        EXPECT_EQ(size, call.GetSize());
    }
}

TEST_F(SettingsBadInput, ATextWithoutRoomIsRefusedUntouched) {
    constexpr decltype(&Zentara_GetSerialString) Functions[] = {Zentara_GetSerialString,
                                                                Zentara_GetCameraModelString};
    for (const auto function : Functions) {
        for (const std::uint32_t length : {0u, 1u, 5u}) {
            Guarded<64> text;
            EXPECT_ZERR(Parameter, function(handle, static_cast<char*>(text.Get()), length));
            EXPECT_TRUE(text.IsUntouched()) << length;
        }
        Guarded<64> text;
        EXPECT_ZERR(None, function(handle, static_cast<char*>(text.Get()), 0xFFFFFFFF));
        EXPECT_TRUE(text.AreGuardsIntact());
    }
}

TEST_F(SettingsBadInput, AClosedCameraIsRefused) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    ExpectOfHandle(&Row::closed, "closed", handle);
}

TEST_F(SettingsBadInput, ACameraThatALaterListingErasedIsRefused) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ListCameras();

    ExpectOfHandle(&Row::closed, "stale", handle);
}

TEST_F(SettingsBadInput, AHandleOfAnEarlierLoadIsRefused) {
    Zentara_ReleaseDriver();
    ASSERT_ZERR(zerrNone, Zentara_LoadDriver());

    ExpectOfHandle(&Row::closed, "of an earlier load", handle);
}

TEST_F(SettingsBadInput, AHandleThatWasNeverGivenIsRefused) {
    for (const ZentaraHandle foreign :
         {ZentaraHandle{1}, ZentaraHandle{0x1000}, handle + 8, handle - 8,
          handle | 0x8000000000000000, ZentaraHandle{0xFFFFFFFFFFFFFFFF}}) {
        ExpectOfHandle(&Row::closed, "never given", foreign);
    }
}

TEST_F(SettingsBadInput, AnUnsupportedKeyOfAClosedCameraIsABadHandleOrBlockFirst) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    for (const Row& row : Rows) {
        // Setters and tables look at the family's limit before they look for the camera.
        const std::string name = row.name;
        if (row.keyCount == NoKeys || row.closed == No || row.closed == None) continue;
        GuardedCall call(row, block);
        call.given.key = row.keyCount;
        call.Expect(name.starts_with("SetParam") ? No : row.closed, "closed, key beyond");
    }
}

/// The listing opens the device three times and the client once; its second open finds another
/// process there.
class BlockOfATakenCamera : public SettingsBadInput {
  protected:
    BlockOfATakenCamera()
        : SettingsBadInput(R"({"base": "colour", "cameras": [{"held": {"from": 5},
                       "sensor": {"width": 64, "height": 48}}]})") {}

    void SetUp() override {
        SettingsBadInput::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        ZentaraHandle again = 0;
        ASSERT_ZERR(zerrDriverFault, Zentara_OpenCamera(0, &again));
        ASSERT_EQ(0u, again);
    }
};

TEST_F(BlockOfATakenCamera, IsRefusedByHandleAndItsBlocksAreAnswered) {
    ExpectOfHandle(&Row::held, "held", handle);
}

// Neither asks who has the camera: what they measure with is missing, since the open has failed.
TEST_F(BlockOfATakenCamera, MeasuresNothing) {
    const Zentara_Settings before = block;

    EXPECT_ZERR(zerrBadSettings, Zentara_WhiteBalance(&block, 0, 0, 64, 48));
    EXPECT_ZERR(zerrBadSettings, Zentara_AutoExpose(&block, 0, 0, 64, 48));

    EXPECT_EQ(0, std::memcmp(&before, &block, sizeof block));
}

// Kept: "another process" is no 1, so a block can be edited while someone else has the camera.
TEST_F(BlockOfATakenCamera, ItsBlocksCanBeReadBoundedAndEdited) {
    std::uint32_t value = 0;

    EXPECT_ZERR(zerrNone, Zentara_GetParam(&block, zprmRoiWidth, &value));
    EXPECT_EQ(64u, value);
    EXPECT_ZERR(zerrNone, Zentara_GetParamMax(&block, zprmRoiHeight, &value));
    EXPECT_EQ(48u, value);
    EXPECT_ZERR(zerrNone, Zentara_SetParam(&block, zprmRoiWidth, 10));
    EXPECT_EQ(10u, GetWord(block, zprmRoiWidth));
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmImageFormat, 6));
    EXPECT_ZERR(zerrNone, Zentara_SetParamS32(&block, zprmS32AbsoluteOffset, -3));
    EXPECT_EQ(-3, GetSigned(block, zprmS32AbsoluteOffset));
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam64(&block, zprm64Exposure, 1));
    EXPECT_EQ(1u, GetWide(block, zprm64Exposure));
}

TEST_F(BlockOfATakenCamera, KeysThatItDoesNotHaveCountAsSupported) {
    std::uint32_t value = 0;
    SetWord(block, zprmReserved17, 1234);

    EXPECT_ZERR(zerrNone, Zentara_GetParam(&block, zprmReserved17, &value));
    EXPECT_EQ(1234u, value);
    EXPECT_ZERR(zerrNotSupported, Zentara_SetParam(&block, zprmReserved17, 1));
    EXPECT_ZERR(zerrNotSupported, Zentara_GetParamMin(&block, zprmReserved17, &value));
    EXPECT_ZERR(zerrNotSupported, Zentara_GetParam(&block, zprmRegisterTweak, &value));
    EXPECT_EQ(1234u, value);
    EXPECT_EQ(1234u, GetWord(block, zprmReserved17));
}

TEST_F(BlockOfATakenCamera, TheListOfTheReadoutPortHasItsOneEntry) {
    std::uint32_t entries[5] = {};
    std::int32_t size = 5;

    EXPECT_ZERR(zerrNone, Zentara_GetParamSparseTable(&block, zprmReadoutPort, entries, &size));

    EXPECT_EQ(1, size);
    EXPECT_EQ(1u, entries[0]);
    EXPECT_ZERR(zerrNone, Zentara_SetParam(&block, zprmReadoutPort, 1));
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmReadoutPort, 2));
}

TEST_F(BlockOfATakenCamera, KeysBeyondAFamilyStayUnsupported) {
    for (const Row& row : Rows) {
        if (row.keyCount == NoKeys || row.held == Handle) continue;
        for (const std::uint32_t key : {row.keyCount, 1000u, 0x80000000u, 0xFFFFFFFFu}) {
            GuardedCall call(row, block);
            call.given.key = key;
            call.Expect(No, "held, key " + std::to_string(key));
        }
    }
}

TEST_F(BlockOfATakenCamera, EveryKeyCanBeTriedWithoutAByteOutsideTheClientsMemory) {
    for (const Row& row : Rows) {
        if (row.keyCount == NoKeys) continue;
        for (std::uint32_t key = 0; key < row.keyCount; ++key) {
            GuardedCall call(row, block);
            call.given.key = key;
            (void)row.call(call.given);
            EXPECT_TRUE(call.AreGuardsIntact()) << row.name << ", key " << key;
        }
    }
}

}  // namespace
}  // namespace ZV::Test

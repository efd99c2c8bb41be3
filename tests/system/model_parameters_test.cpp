#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include "support/flat_camera.h"
#include "support/settings_words.h"
#include "system/camera_session.h"

// What every model tells of every parameter and information key, by the version of its
// configuration block, against tables that are checked in: tests/system/golden/MODEL.txt. Each
// names, for the first version, all keys with
//
//     word 12 zprmImageFormat: yes, read 2, default 2, limits 0 to 5, list 0 1 2 3 4 5
//
// and for each later version the keys that changed. "no" stands for a parameter that the camera
// does not have, "range" and "list" for the tables that the key has, "get" for what an accessor
// gives where it is not the word that was read. Information keys follow as
//
//     info 5 zinfBitDepth: 12
namespace ZV::Test {
namespace {

enum class ParameterFamily { Word, Signed, Wide, Information };

struct KnownKey {
    ParameterFamily family;
    std::uint32_t key;
    const char* name;
};

std::vector<KnownKey> GetKnownKeys() {
    struct ValueName {
        std::uint32_t value;
        const char* name;
    };
    struct Row {
        ParameterFamily family;
        std::uint32_t key;
        const char *name, *unit, *meaning;
        std::vector<ValueName> values;
    };
    const Row rows[] = {
#include "tools/parameter_names.inc"
    };
    std::vector<KnownKey> keys;
    for (const Row& row : rows) keys.push_back({row.family, row.key, row.name});
    return keys;
}

struct WordFunctions {
    using Value = std::uint32_t;
    static constexpr const char* Name = "word";
    static constexpr auto IsSupported = Zentara_IsParamSupported;
    static constexpr auto IsRange = Zentara_IsRangeTable;
    static constexpr auto IsList = Zentara_IsSparseTable;
    static constexpr auto GetList = Zentara_GetParamSparseTable;
    static constexpr auto Get = Zentara_GetParam;
    static constexpr auto GetLeast = Zentara_GetParamMin;
    static constexpr auto GetGreatest = Zentara_GetParamMax;
    static constexpr auto ReadBlock = GetWord;
};

struct SignedFunctions {
    using Value = std::int32_t;
    static constexpr const char* Name = "signed";
    static constexpr auto IsSupported = Zentara_IsParamS32Supported;
    static constexpr auto IsRange = Zentara_IsRangeTableS32;
    static constexpr auto IsList = Zentara_IsSparseTableS32;
    static constexpr auto GetList = Zentara_GetParamSparseTableS32;
    static constexpr auto Get = Zentara_GetParamS32;
    static constexpr auto GetLeast = Zentara_GetParamS32Min;
    static constexpr auto GetGreatest = Zentara_GetParamS32Max;
    static constexpr auto ReadBlock = GetSigned;
};

struct WideFunctions {
    using Value = std::uint64_t;
    static constexpr const char* Name = "wide";
    static constexpr auto IsSupported = Zentara_IsParam64Supported;
    static constexpr auto IsRange = Zentara_IsRangeTable64;
    static constexpr auto IsList = Zentara_IsSparseTable64;
    static constexpr auto GetList = Zentara_GetParamSparseTable64;
    static constexpr auto Get = Zentara_GetParam64;
    static constexpr auto GetLeast = Zentara_GetParam64Min;
    static constexpr auto GetGreatest = Zentara_GetParam64Max;
    static constexpr auto ReadBlock = GetWide;
};

/// The value, or "refused CODE".
template <typename Function, typename Value>
std::string Tell(Function function, Zentara_Settings& block, std::uint32_t key, Value untouched) {
    Value value = untouched;
    const ZentaraResult result = function(&block, key, &value);
    if (result == zerrNone) return std::to_string(value);
    EXPECT_EQ(untouched, value) << "a refusal wrote its value, key " << key;
    return "refused " + std::to_string(result);
}

struct OpenedBlocks {
    ZentaraHandle handle;
    Zentara_Settings read, defaults;
};

template <typename Functions>
std::string DescribeList(Zentara_Settings& block, std::uint32_t key) {
    typename Functions::Value entries[100];
    std::int32_t count = 100;
    const ZentaraResult result = Functions::GetList(&block, key, entries, &count);
    if (result != zerrNone) return result == zerrNotSupported ? "" : "a list that fails";
    std::string text = ", list";
    for (std::int32_t i = 0; i < count; ++i) text += " " + std::to_string(entries[i]);
    return text;
}

template <typename Functions>
std::string DescribeOffer(OpenedBlocks& blocks, std::uint32_t key, const std::string& read) {
    using Value = typename Functions::Value;
    constexpr Value Untouched = 77;
    Zentara_Settings& block = blocks.read;
    std::string text;
    const std::string got = Tell(Functions::Get, block, key, Untouched);
    if (got != read) text += ", get " + got;
    const std::string least = Tell(Functions::GetLeast, block, key, Untouched);
    const std::string greatest = Tell(Functions::GetGreatest, block, key, Untouched);
    text += least == "refused 1" && greatest == least ? ", no limits"
                                                      : ", limits " + least + " to " + greatest;
    if (Functions::IsRange(&block, key) == zerrNone) text += ", range";
    const std::string list = DescribeList<Functions>(block, key);
    EXPECT_EQ(list.empty(), Functions::IsList(&block, key) != zerrNone) << "key " << key;
    return text + list;
}

/// A key that the camera does not have is refused by every question, and nothing is written.
template <typename Functions>
void ExpectNothingOffered(Zentara_Settings& block, const KnownKey& known) {
    using Value = typename Functions::Value;
    constexpr Value Untouched = 77;
    for (const auto function : {Functions::Get, Functions::GetLeast, Functions::GetGreatest}) {
        EXPECT_EQ("refused 1", Tell(function, block, known.key, Untouched)) << known.name;
    }
    EXPECT_ZERR(zerrNotSupported, Functions::IsRange(&block, known.key)) << known.name;
    EXPECT_ZERR(zerrNotSupported, Functions::IsList(&block, known.key)) << known.name;
    Value entry = Untouched;
    std::int32_t count = 1;
    EXPECT_ZERR(zerrNotSupported, Functions::GetList(&block, known.key, &entry, &count))
        << known.name;
    EXPECT_EQ(Untouched, entry) << known.name;
}

template <typename Functions>
std::string DescribeKey(OpenedBlocks& blocks, const KnownKey& known) {
    const std::string read = std::to_string(Functions::ReadBlock(blocks.read, known.key));
    const std::string initial = std::to_string(Functions::ReadBlock(blocks.defaults, known.key));
    const bool has = Functions::IsSupported(blocks.handle, known.key) == zerrNone;
    if (!has) ExpectNothingOffered<Functions>(blocks.read, known);
    return std::string(Functions::Name) + " " + std::to_string(known.key) + " " + known.name +
           ": " + (has ? "yes" : "no") + ", read " + read + ", default " + initial +
           (has ? DescribeOffer<Functions>(blocks, known.key, read) : "");
}

std::string DescribeInformation(ZentaraHandle handle, const KnownKey& known) {
    constexpr std::uint32_t Untouched = 77;
    std::uint32_t value = Untouched;
    const ZentaraResult result = Zentara_GetInfo(handle, known.key, &value);
    std::string text = "info " + std::to_string(known.key) + " " + known.name + ": ";
    if (result != zerrNone) text += "refused " + std::to_string(result) + ", ";
    return text + (value == Untouched ? "untouched" : std::to_string(value));
}

std::string DescribeKnown(OpenedBlocks& blocks, const KnownKey& known) {
    if (known.family == ParameterFamily::Word) return DescribeKey<WordFunctions>(blocks, known);
    if (known.family == ParameterFamily::Signed) return DescribeKey<SignedFunctions>(blocks, known);
    if (known.family == ParameterFamily::Information) {
        return DescribeInformation(blocks.handle, known);
    }
    return DescribeKey<WideFunctions>(blocks, known);
}

/// One line per key, or one that tells why there are none.
std::vector<std::string> DescribeCamera(const std::string& model, const std::string& version) {
    SimulationWorld world(R"({"base": "model:)" + model +
                          R"(", "cameras": [{"versions": {"configuration": ")" + version +
                          R"("}}]})");
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    const ZentaraResult listed = Zentara_ListCameras(&item, &length);
    std::vector<std::string> lines;
    OpenedBlocks blocks{};
    if (listed != zerrNone || length != 1) {
        lines.push_back("the listing gives " + std::to_string(listed) + " and " +
                        std::to_string(length) + " cameras");
    } else if (Zentara_OpenCamera(item.cameraId, &blocks.handle) != zerrNone) {
        lines.emplace_back("the camera cannot be opened");
    } else {
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(blocks.handle, &blocks.read));
        EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(blocks.handle, &blocks.defaults));
        for (const KnownKey& known : GetKnownKeys()) {
            lines.push_back(DescribeKnown(blocks, known));
        }
    }
    Zentara_ReleaseDriver();
    return lines;
}

class ModelParameters : public testing::TestWithParam<const char*> {
  protected:
    // The model that is unknown says so at each question, and so do keys without an answer.
    void SetUp() override { testing::internal::CaptureStdout(); }
    void TearDown() override { (void)testing::internal::GetCapturedStdout(); }

    static std::string Describe(const std::string& model) {
        std::ostringstream out;
        std::map<std::string, std::string> known;
        for (const char* const version : {"1.1", "2.1", "2.4", "2.7", "2.8", "2.9", "2.11"}) {
            out << "configuration " << version << "\n";
            for (const std::string& line : DescribeCamera(model, version)) {
                std::string& before = known[line.substr(0, line.find(':'))];
                if (before != line) out << "  " << line << "\n";
                before = line;
            }
        }
        return out.str();
    }
};

std::string ReadText(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

TEST_P(ModelParameters, AreThoseOfTheModelsTableInEveryVersionOfItsConfiguration) {
    const std::string name = std::string(GetParam()) + ".txt";
    const std::string actual = Describe(GetParam());

    const std::string expected =
        ReadText(std::filesystem::path(ZENTARA_SOURCE_DIR) / "tests/system/golden" / name);

    const auto written = std::filesystem::path(ZENTARA_BINARY_DIR) / "golden" / name;
    std::filesystem::create_directories(written.parent_path());
    std::ofstream(written) << actual;
    EXPECT_EQ(expected, actual) << "what the library tells stands in " << written;
}

TEST_P(ModelParameters, HaveNoShutterState) {
    const CameraSession session(std::string("model:") + GetParam());
    ASSERT_TRUE(session.IsOpen());

    EXPECT_ZERR(zerrNotSupported, Zentara_IsParamSupported(session.GetHandle(), 18));
}

TEST_P(ModelParameters, TellASerialNumberOfZeroAndModelBOnEveryCamera) {
    const CameraSession session(std::string("model:") + GetParam());
    ASSERT_TRUE(session.IsOpen());
    std::uint32_t value = 77;

    EXPECT_ZERR(zerrNone, Zentara_GetInfo(session.GetHandle(), 1, &value));
    EXPECT_EQ(0u, value);
    EXPECT_ZERR(zerrNone, Zentara_GetInfo(session.GetHandle(), 16, &value));
    EXPECT_EQ(1u, value);
}

INSTANTIATE_TEST_SUITE_P(AllModels, ModelParameters,
                         testing::Values("SolvaneA1", "SolvaneA2", "DorixB1", "Folary", "SolvaneK1",
                                         "DorixR1", "SolvaneC1", "SolvaneB1", "PellanA1",
                                         "SolvaneD1", "SolvaneF1", "SolvaneC2", "SolvaneB2",
                                         "PellanB1", "SolvaneE1", "PellanA2", "SolvaneD2",
                                         "SolvaneG2", "SolvaneG1", "TirelM2", "TirelM1",
                                         "SolvaneH1", "SolvaneJ1", "Metrona", "Unknown"),
                         [](const auto& model) { return std::string(model.param); });

}  // namespace
}  // namespace ZV::Test

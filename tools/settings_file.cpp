#include "settings_file.h"

#include <fmt/format.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>
#include <system_error>

#include "image_writers.h"
#include "output.h"
#include "paths.h"
#include "unfinished_file.h"

namespace ZentaraProgram {
namespace {

using nlohmann::ordered_json;

constexpr std::size_t GreatestFile = 1 << 20;

/// Goes through a text and counts the lines that lie behind it.
class LineIterator {
  public:
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = const char*;
    using reference = const char&;

    LineIterator(const char* position, std::size_t* lineCount) : place(position), line(lineCount) {}

    reference operator*() const { return *place; }
    LineIterator& operator++() {
        if (*place == '\n') ++*line;
        ++place;
        return *this;
    }
    bool operator==(const LineIterator& other) const { return place == other.place; }
    bool operator!=(const LineIterator& other) const { return place != other.place; }

  private:
    const char* place;
    std::size_t* line;  // borrowed from the reader, until the parse ends
};

/// What stands behind a name of the file.
enum class JsonKind { Text, Number, Truth, Other };

/// The parser's words without its number and without the place, "[...] parse error at ...: ".
std::string_view GetReason(std::string_view words) {
    for (const std::string_view mark : {"] ", ": "}) {
        const std::size_t at = words.find(mark);
        if (at != std::string_view::npos) words.remove_prefix(at + mark.size());
    }
    return words;
}

/// Takes the parser's events: an object of texts, and in it the object of the settings. The values
/// of nested lists and objects are passed over; they are refused at their begin.
class SettingsReader : public nlohmann::json_sax<nlohmann::json> {
  public:
    SettingsReader(const std::string& path, const std::size_t* line,
                   std::vector<std::string>* problemList)
        : file(path), currentLine(line), problems(problemList) {}

    [[nodiscard]] std::vector<SettingEdit> TakeEdits() { return std::move(edits); }
    [[nodiscard]] bool HasSettings() const { return hasSettings; }

    bool null() override { return Value(JsonKind::Other, "null"); }
    bool boolean(bool value) override { return Value(JsonKind::Truth, value ? "true" : "false"); }
    bool number_integer(std::int64_t value) override {
        return Value(JsonKind::Number, fmt::format("{}", value));
    }
    bool number_unsigned(std::uint64_t value) override {
        return Value(JsonKind::Number, fmt::format("{}", value));
    }
    bool number_float(double, const std::string& text) override {
        return Value(JsonKind::Number, text);
    }
    bool string(std::string& text) override { return Value(JsonKind::Text, text); }
    bool binary(nlohmann::json::binary_t&) override { return true; }
    bool key(std::string& text) override {
        keyLine = *currentLine;
        name = text;
        return true;
    }
    bool start_object(std::size_t) override {
        if (depth == 1 && name == "settings" && !hasSettings) {
            hasSettings = true;
            depth = SettingsDepth;
            return true;
        }
        const bool isDocument = depth == 0;
        if (!isDocument) (void)Value(JsonKind::Other, "an object");
        ++depth;
        return true;
    }
    bool end_object() override {
        depth = depth == SettingsDepth ? 1 : depth - 1;
        return true;
    }
    bool start_array(std::size_t) override {
        (void)Value(JsonKind::Other, "a list");
        ++depth;
        return true;
    }
    bool end_array() override {
        --depth;
        return true;
    }
    /// The parser's own words hold the line: it may have read beyond what it refuses.
    bool parse_error(std::size_t, const std::string&,
                     const nlohmann::json::exception& failure) override {
        const std::string_view text = failure.what();
        constexpr std::string_view LineMark = "at line ";
        std::size_t line = depth > 0 ? keyLine : *currentLine;
        const std::size_t mark = text.find(LineMark);
        if (mark != std::string_view::npos) {
            const std::string_view digits = text.substr(mark + LineMark.size());
            (void)std::from_chars(digits.data(), digits.data() + digits.size(),
                                  line);  // Without a number it stays the line of the key.
        }
        constexpr std::string_view BehindLineEnd = "<U+000A>'";  // the last that was read
        if (text.ends_with(BehindLineEnd) && line > 1) --line;
        Refuse(line, fmt::format("this is no JSON: {}", GetReason(text)));
        return false;
    }

  private:
    // Between the depth of the document's members and that of the settings nothing is nested.
    static constexpr int SettingsDepth = 1000000;

    void Refuse(std::size_t line, const std::string& reason) {
        problems->push_back(fmt::format("{}:{}: {}", file, line, MakeHarmless(reason)));
    }

    bool Value(JsonKind kind, const std::string& text) {
        if (depth == 0) Refuse(*currentLine, "an object is wanted, not " + text);
        if (depth == 1) TakeMember(kind, text);
        if (depth == SettingsDepth) TakeSetting(kind, text);
        return true;
    }

    /// Model and serial number tell a reader where the settings come from; nothing hangs on them.
    void TakeMember(JsonKind kind, const std::string& text) {
        static const std::vector<std::string> known{"model", "serialNumber", "settings"};
        if (std::find(known.begin(), known.end(), name) == known.end()) {
            Refuse(keyLine, DescribeUnknown("member", name, known));
        } else if (name == "settings") {
            Refuse(keyLine, hasSettings ? "settings stand here twice"
                                        : "settings: an object is wanted, not " + text);
        } else if (kind != JsonKind::Text) {
            Refuse(keyLine, fmt::format("{}: a text is wanted, not {}", name, text));
        }
    }

    void TakeSetting(JsonKind kind, const std::string& text) {
        const Setting* setting = FindSetting(name);
        if (setting == nullptr) return Refuse(keyLine, DescribeUnknownSetting(name));
        if (std::any_of(edits.begin(), edits.end(),
                        [&](const SettingEdit& edit) { return edit.setting == setting; }))
            return Refuse(keyLine, fmt::format("{} stands here twice", setting->name));
        const bool isSwitched = kind != JsonKind::Truth || setting->kind == ValueKind::Switch;
        if (kind == JsonKind::Other || !isSwitched)
            return Refuse(keyLine, DescribeWrongType(*setting, text));
        const ParsedValue parsed = ParseValue(*setting, text);
        if (!parsed.value) return Refuse(keyLine, parsed.problem);
        edits.push_back({setting, *parsed.value, fmt::format("{}:{}: ", file, keyLine)});
    }

    static std::string DescribeWrongType(const Setting& setting, const std::string& text) {
        const char* wanted = setting.kind == ValueKind::Switch ? "true or false"
                             : IsPlainNumber(setting)          ? "a number"
                                                               : "a text";
        return fmt::format("{}: {} is wanted, not {}", setting.name, wanted, text);
    }

    const std::string& file;
    const std::size_t* currentLine;
    std::vector<std::string>* problems;
    std::vector<SettingEdit> edits;
    std::string name;
    std::size_t keyLine = 1;
    int depth = 0;
    bool hasSettings = false;
};

bool ReadText(const std::string& path, std::string* text) {
    std::ifstream file(MakePath(path), std::ios::binary);
    if (!file) return false;
    text->resize(GreatestFile + 1);
    file.read(text->data(), static_cast<std::streamsize>(text->size()));
    text->resize(static_cast<std::size_t>(file.gcount()));
    return !file.bad();
}

ordered_json GetSettingsAsJson(const SettingsBlock& block) {
    ordered_json settings = ordered_json::object();
    for (const Setting& setting : GetSettings()) {
        const auto value = setting.isStored ? block.Get(setting) : std::nullopt;
        if (value) settings[setting.name] = GetValueAsJson(setting, *value);
    }
    return settings;
}

bool WriteText(const std::string& path, const std::string& text) {
    std::ofstream file(MakePath(path), std::ios::binary | std::ios::trunc);
    file << text;
    file.close();
    return !file.fail();
}

}  // namespace

std::vector<SettingEdit> ReadSettingsFile(const std::string& path,
                                          std::vector<std::string>* problems) {
    std::string text;
    if (!ReadText(path, &text)) {
        problems->push_back(path + " cannot be read");
        return {};
    }
    if (text.size() > GreatestFile) {
        problems->push_back(path + " is too large for a file of settings");
        return {};
    }
    std::size_t line = 1;
    SettingsReader reader(path, &line, problems);
    const std::size_t before = problems->size();
    const char* begin = text.data();
    const bool isParsed = nlohmann::json::sax_parse(
        LineIterator(begin, &line), LineIterator(begin + text.size(), &line), &reader);
    if (isParsed && !reader.HasSettings() && problems->size() == before)
        problems->push_back(path + ": the member settings is missing");
    return reader.TakeEdits();
}

std::string WriteSettingsFile(const std::string& path, const Camera& camera,
                              const SettingsBlock& block) {
    const ordered_json document{{"model", camera.GetModelName()},
                                {"serialNumber", camera.GetSerialNumber()},
                                {"settings", GetSettingsAsJson(block)}};
    const std::string text =
        document.dump(2, ' ', false, ordered_json::error_handler_t::replace) + "\n";
    const UnfinishedFile unfinished(path);
    if (unfinished.GetFailure()) return DescribeFailure(unfinished.GetFailure());
    errno = 0;
    if (!WriteText(unfinished.GetPath(), text)) return DescribeFileFailure();
    const std::error_code failure = unfinished.Finish();
    return failure ? DescribeFailure(failure) : std::string{};
}

ordered_json GetValueAsJson(const Setting& setting, SettingValue value) {
    const bool isTruth = setting.kind == ValueKind::Switch && (value == 0 || value == 1);
    if (isTruth) return value != 0;
    if (IsPlainNumber(setting)) return value;
    return FormatValue(setting, value);
}

}  // namespace ZentaraProgram

#pragma once

#include <cstdint>
#include <limits>
#include <nlohmann/json.hpp>
#include <span>
#include <string>
#include <string_view>

namespace ZV::Simulation {

/// Why reading stopped: the first thing that is wrong, with its JSON pointer.
struct ReadFailure {
    std::string message;
    bool HasFailed() const { return !message.empty(); }
};

/// A value in a document, with its place. The getters check type and range; on a mismatch they note
/// the failure, unless there is one already, and leave their target alone.
class JsonNode {
  public:
    using Json = nlohmann::json;

    JsonNode(const Json& nodeValue, std::string nodePointer, ReadFailure* nodeFailure)
        : value(nodeValue), pointer(std::move(nodePointer)), failure(nodeFailure) {}

    const Json& GetValue() const { return value; }
    bool HasFailed() const { return failure->HasFailed(); }
    void Fail(const std::string& reason) const;

    JsonNode GetChild(const std::string& key) const;
    JsonNode GetElement(std::size_t index) const;
    bool Has(const char* key) const { return value.is_object() && value.contains(key); }

    void Get(bool* target) const;
    void Get(std::string* target) const;
    void Get(double* target, double minimum, double maximum) const;
    /// A whole number, or a text of it such as "0x1F".
    void GetWhole(std::uint64_t* target, std::uint64_t minimum, std::uint64_t maximum) const;
    template <typename Whole>
    void Get(Whole* target, std::uint64_t minimum = 0,
             std::uint64_t maximum = std::numeric_limits<Whole>::max()) const {
        std::uint64_t number = *target;
        GetWhole(&number, minimum, maximum);
        *target = static_cast<Whole>(number);
    }
    /// One of `names`; its position goes to `target`.
    void GetChoice(std::size_t* target, std::span<const std::string_view> names) const;

    bool CheckObject() const;
    bool CheckArray() const;

  private:
    const Json& value;
    std::string pointer;
    ReadFailure* failure;
};

/// A key of an object and what reads it.
template <typename Target>
struct JsonKey {
    std::string_view name;
    void (*read)(const JsonNode& node, Target* target);
};

/// Reads each member of an object by its row; a member without a row is refused.
template <typename Target>
void ReadObject(const JsonNode& node, std::span<const JsonKey<Target>> keys, Target* target) {
    if (!node.CheckObject()) return;
    for (const auto& [name, value] : node.GetValue().items()) {
        const JsonNode child = node.GetChild(name);
        const JsonKey<Target>* found = nullptr;
        for (const JsonKey<Target>& key : keys) {
            if (key.name == name) found = &key;
        }
        if (found == nullptr) return child.Fail("is not a key that is known here");
        found->read(child, target);
        if (node.HasFailed()) return;
    }
}

/// Parses a document. False with line and column of what is wrong; a key that stands twice in an
/// object is wrong as well.
bool ParseJson(const std::string& text, nlohmann::json* document, std::string* message);

}  // namespace ZV::Simulation

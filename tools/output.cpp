#include "output.h"

#include <nlohmann/json.hpp>

namespace ZentaraProgram {
namespace {

std::FILE* output = nullptr;

}  // namespace

void SetOutput(std::FILE* stream) {
    output = stream;
}

void Print(const std::string& text) {
    (void)std::fputs(text.c_str(), output);  // A failure stays in the stream; FlushOutput tells.
}

void PrintJson(const nlohmann::json& value) {
    Print(value.dump(2, ' ', false, nlohmann::json::error_handler_t::replace) + "\n");
}

void PrintJson(const nlohmann::ordered_json& value) {
    Print(value.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n");
}

void PrintError(const std::string& text) {
    (void)std::fputs(("zentara: " + text + "\n").c_str(), stderr);  // There is no one else to tell.
}

std::string MakeHarmless(std::string text) {
    constexpr unsigned char FirstPrinted = 32, Delete = 127, LastControl = 0x9F;
    // In UTF-8 the controls 0x80 to 0x9F are this byte and their own.
    constexpr unsigned char ControlLead = 0xC2;
    unsigned char before = 0;
    for (char& letter : text) {
        const auto byte = static_cast<unsigned char>(letter);
        const bool isPair = before == ControlLead && byte > Delete && byte <= LastControl;
        if (byte < FirstPrinted || byte == Delete || isPair) letter = '?';
        before = byte;
    }
    return text;
}

bool FlushOutput() {
    return std::fflush(output) == 0 && std::ferror(output) == 0;
}

}  // namespace ZentaraProgram

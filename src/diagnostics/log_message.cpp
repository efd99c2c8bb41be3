#include <charconv>
#include <cstdarg>
#include <cstddef>
#include <cstdint>

#include "diagnostics/log.h"
#include "diagnostics/log_records.h"
#include "diagnostics/log_state.h"

namespace ZV {

namespace {

/// A text of bounded length: what does not fit is left out.
class ExpandedText {
  public:
    void Append(char character) {
        if (length + 1 < sizeof text) text[length++] = character;
    }
    void Append(const char* characters) {
        while (*characters != '\0') Append(*characters++);
    }
    const char* Finish() {
        text[length] = '\0';
        return text;
    }

  private:
    char text[LogRecordCapacity];
    std::size_t length = 0;
};

/// The values of a message, in a form that can be handed on.
struct MessageValues {
    std::va_list list;
};

void AppendNumber(ExpandedText& text, std::int64_t number) {
    char digits[24] = {};
    std::to_chars(digits, digits + sizeof digits - 1, number);
    text.Append(digits);
}

void AppendCharacter(ExpandedText& text, MessageValues& values) {
    const auto character = static_cast<char>(va_arg(values.list, int));
    if (character != '\0') text.Append(character);
}

// Kept: a value of 0x80000000 and above is shown as a negative one.
void AppendNumber32(ExpandedText& text, MessageValues& values) {
    AppendNumber(text, static_cast<std::int32_t>(va_arg(values.list, std::uint32_t)));
}

void AppendNumber64(ExpandedText& text, MessageValues& values) {
    AppendNumber(text, static_cast<std::int64_t>(va_arg(values.list, std::uint64_t)));
}

void AppendString(ExpandedText& text, MessageValues& values) {
    const char* const characters = va_arg(values.list, const char*);
    text.Append(characters != nullptr ? characters : "(null)");
}

struct MessageConversion {
    char letter;
    void (*append)(ExpandedText& text, MessageValues& values);
};

constexpr MessageConversion Conversions[] = {
    {'c', AppendCharacter},
    {'d', AppendNumber32},
    {'l', AppendNumber64},
    {'s', AppendString},
};

/// `format` stands at a "%". Returns where to go on.
const char* ExpandConversion(const char* format, ExpandedText& text, MessageValues& values) {
    const char letter = format[1];
    for (const MessageConversion& row : Conversions) {
        if (row.letter != letter) continue;
        row.append(text, values);
        text.Append(' ');  // Kept: behind each value
        return format + 2;
    }
    text.Append(format[0]);
    if (letter == '\0') return format + 1;
    text.Append(letter);
    return format + 2;
}

void Expand(const char* format, ExpandedText& text, MessageValues& values) {
    while (*format != '\0') {
        if (*format == '%') {
            format = ExpandConversion(format, text, values);
            continue;
        }
        text.Append(*format);
        // Kept: what follows a backslash is lost, not the backslash.
        const bool skipsNext = *format == '\\' && format[1] != '\0';
        format += skipsNext ? 2 : 1;
    }
}

}  // namespace

void ZLogMessage(const char* function, const char* format, ...) {
    if (logState.outputEnabled == 0) return;
    ExpandedText text;
    MessageValues values;
    va_start(values.list, format);
    Expand(format, text, values);
    va_end(values.list);
    ZLogWrite("%s - %s", function, text.Finish());
}

}  // namespace ZV

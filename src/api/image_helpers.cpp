#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

// Kept: these answer 1 for yes, unlike the functions that answer by a result code.
std::uint32_t TellFormat(const char* function, const char* message, bool (*isTrue)(std::uint32_t),
                         std::uint32_t format) {
    ZLogEnter(function);
    const std::uint32_t answer = isTrue(format) ? 1 : 0;
    ZLogMessage(function, message, answer);
    ZLogLeave(function, zerrNone);
    return answer;
}

}  // namespace

}  // namespace ZV

uint32_t Zentara_is16bit(uint32_t format) {
    return ZV::TellFormat("Zentara_is16bit", "Is 16-bit = %d", ZV::Is16Bit, format);
}

uint32_t Zentara_is3Color(uint32_t format) {
    return ZV::TellFormat("Zentara_is3Color", "Is 3 colour = %d", ZV::Is3Colour, format);
}

uint32_t Zentara_isBayer(uint32_t format) {
    return ZV::TellFormat("Zentara_isBayer", "Is bayer = %d", ZV::IsBayer, format);
}

uint32_t Zentara_isColor(uint32_t format) {
    return ZV::TellFormat("Zentara_isColor", "Is colour = %d", ZV::IsColour, format);
}

uint32_t Zentara_isMonochrome(uint32_t format) {
    return ZV::TellFormat("Zentara_isMonochrome", "Is mono = %d", ZV::IsMonochrome, format);
}

uint64_t Zentara_CalcImageSize(uint32_t format, uint32_t width, uint32_t height) {
    constexpr const char* Function = "Zentara_CalcImageSize";
    ZV::ZLogEnter(Function);
    const std::uint64_t bytes = ZV::CalculateImageSize(format, width, height);
    // Kept: the log prints the low 32 bits of the size.
    ZV::ZLogMessage(Function, "Size = %d", static_cast<std::uint32_t>(bytes));
    ZV::ZLogLeave(Function, zerrNone);
    return bytes;
}

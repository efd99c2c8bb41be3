#pragma once

#include <array>
#include <cstdint>

namespace ZV {

/// What the processor and the operating system answered about themselves. Leaves that the processor
/// does not have are 0.
struct ProcessorAnswers {
    std::uint32_t greatestLeaf = 0;
    std::array<char, 12> vendor{};
    std::uint32_t leaf1Ecx = 0;
    std::uint32_t leaf1Edx = 0;
    std::uint32_t leaf4Eax = 0;
    std::uint32_t leaf7Ebx = 0;
    std::uint32_t leaf7Ecx = 0;
    std::uint32_t greatestExtendedLeaf = 0;
    std::uint32_t extended1Edx = 0;
    /// Register states that the operating system keeps (XCR0); 0 where it cannot be asked.
    std::uint64_t keptStates = 0;
};

/// Asks the processor. Reentrant; takes some microseconds under a hypervisor.
[[nodiscard]] ProcessorAnswers AskProcessor();

/// Classes of processors: 33 and 34 have SSSE3 and below 3 or more cores; 32 and 68 have 64-bit
/// mode without it, by vendor; 66, 65 and 64 have SSE3, SSE2 and SSE alone; 0 has none of these.
[[nodiscard]] std::int32_t CalculateProcessorClass(const ProcessorAnswers& answers);

/// The kernel index of a processor class: 1 for 32, 2 for 33 to 35, 0 for all others.
[[nodiscard]] std::int32_t CalculateKernelIndex(std::int32_t processorClass);

/// What a form of the row kernels needs, of the processor and for wide registers of the operating
/// system as well.
[[nodiscard]] bool HasSSE2(const ProcessorAnswers& answers);
[[nodiscard]] bool HasSSSE3(const ProcessorAnswers& answers);
[[nodiscard]] bool HasAVX2(const ProcessorAnswers& answers);
[[nodiscard]] bool HasAVX512(const ProcessorAnswers& answers);

}  // namespace ZV

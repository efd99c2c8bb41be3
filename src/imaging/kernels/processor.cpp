#include "imaging/kernels/processor.h"

#include <cpuid.h>

#include <cstring>
#include <string_view>

namespace ZV {

namespace {

constexpr std::uint32_t ExtendedLeaves = 0x80000000;

// Leaf 1, ECX.
constexpr std::uint32_t HaveSSE3 = 1U << 0;
constexpr std::uint32_t HaveSSSE3 = 1U << 9;
constexpr std::uint32_t HaveStateQuery = 1U << 27;
/// AVX and what compilers take for granted with it: SSE4.1, SSE4.2 and the count of bits.
constexpr std::uint32_t HaveAVX =
    HaveSSE3 | HaveSSSE3 | 1U << 19 | 1U << 20 | 1U << 23 | HaveStateQuery | 1U << 28;
// Leaf 1, EDX.
constexpr std::uint32_t HaveSSE = 1U << 25;
constexpr std::uint32_t HaveSSE2 = 1U << 26;
// Extended leaf 1, EDX.
constexpr std::uint32_t Have64BitMode = 1U << 29;
// Leaf 7, EBX and ECX.
constexpr std::uint32_t HaveAVX2 = 1U << 5;
constexpr std::uint32_t HaveAVX512 = 1U << 16 | 1U << 17 | 1U << 30 | 1U << 31;
constexpr std::uint32_t HaveAVX512VBMI = 1U << 1;

// XCR0: the registers of SSE and AVX, and with AVX-512 its masks and both halves of its registers.
constexpr std::uint64_t KeptAVX = 0x06;
constexpr std::uint64_t KeptAVX512 = 0xE6;

struct Registers {
    std::uint32_t eax = 0, ebx = 0, ecx = 0, edx = 0;
};

Registers AskLeaf(std::uint32_t leaf) {
    Registers answer;
    __cpuid_count(leaf, 0, answer.eax, answer.ebx, answer.ecx, answer.edx);
    return answer;
}

std::uint64_t AskKeptStates() {
    std::uint32_t low = 0;
    std::uint32_t high = 0;
    // The compiler offers this instruction only to sources built for processors that have it.
    asm volatile("xgetbv" : "=a"(low), "=d"(high) : "c"(0));
    return std::uint64_t{high} << 32 | low;
}

void AskFeatures(ProcessorAnswers* answers) {
    const Registers leaf1 = AskLeaf(1);
    answers->leaf1Ecx = leaf1.ecx;
    answers->leaf1Edx = leaf1.edx;
    if ((leaf1.ecx & HaveStateQuery) != 0) answers->keptStates = AskKeptStates();
    if (answers->greatestLeaf >= 4) answers->leaf4Eax = AskLeaf(4).eax;
    if (answers->greatestLeaf < 7) return;
    const Registers leaf7 = AskLeaf(7);
    answers->leaf7Ebx = leaf7.ebx;
    answers->leaf7Ecx = leaf7.ecx;
}

constexpr bool HasAll(std::uint64_t word, std::uint64_t bits) {
    return (word & bits) == bits;
}

bool Has64BitMode(const ProcessorAnswers& answers) {
    return answers.greatestExtendedLeaf > ExtendedLeaves &&
           HasAll(answers.extended1Edx, Have64BitMode);
}

bool IsNamedVendor(const ProcessorAnswers& answers) {
    return std::string_view(answers.vendor.data(), answers.vendor.size()) == "GenuineIntel";
}

std::uint32_t CountCores(const ProcessorAnswers& answers) {
    return answers.greatestLeaf < 4 ? 1 : (answers.leaf4Eax >> 26) + 1;
}

}  // namespace

ProcessorAnswers AskProcessor() {
    ProcessorAnswers answers;
    const Registers leaf0 = AskLeaf(0);
    const std::uint32_t vendor[3] = {leaf0.ebx, leaf0.edx, leaf0.ecx};
    std::memcpy(answers.vendor.data(), vendor, sizeof vendor);
    answers.greatestLeaf = leaf0.eax;
    if (leaf0.eax >= 1) AskFeatures(&answers);
    answers.greatestExtendedLeaf = AskLeaf(ExtendedLeaves).eax;
    if (answers.greatestExtendedLeaf > ExtendedLeaves) {
        answers.extended1Edx = AskLeaf(ExtendedLeaves + 1).edx;
    }
    return answers;
}

std::int32_t CalculateProcessorClass(const ProcessorAnswers& answers) {
    if (HasSSSE3(answers)) return CountCores(answers) < 3 ? 33 : 34;
    if (Has64BitMode(answers)) return IsNamedVendor(answers) ? 32 : 68;
    if (HasAll(answers.leaf1Ecx, HaveSSE3)) return 66;
    if (HasSSE2(answers)) return 65;
    return HasAll(answers.leaf1Edx, HaveSSE) ? 64 : 0;
}

std::int32_t CalculateKernelIndex(std::int32_t processorClass) {
    if (processorClass == 32) return 1;
    return processorClass >= 33 && processorClass <= 35 ? 2 : 0;
}

bool HasSSE2(const ProcessorAnswers& answers) {
    return HasAll(answers.leaf1Edx, HaveSSE2);
}

bool HasSSSE3(const ProcessorAnswers& answers) {
    return HasAll(answers.leaf1Ecx, HaveSSSE3);
}

bool HasAVX2(const ProcessorAnswers& answers) {
    return HasAll(answers.leaf1Ecx, HaveAVX) && HasAll(answers.leaf7Ebx, HaveAVX2) &&
           HasAll(answers.keptStates, KeptAVX);
}

bool HasAVX512(const ProcessorAnswers& answers) {
    return HasAVX2(answers) && HasAll(answers.leaf7Ebx, HaveAVX512) &&
           HasAll(answers.leaf7Ecx, HaveAVX512VBMI) && HasAll(answers.keptStates, KeptAVX512);
}

}  // namespace ZV

#include "imaging/kernels/kernel_selection.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <ostream>
#include <string>
#include <thread>
#include <vector>

#include "imaging/image_pipeline.h"
#include "imaging/kernels/processor.h"
#include "support/scoped_variable.h"

namespace ZV {
namespace {

using Test::ScopedVariable;

constexpr const char* FormNames[] = {"plain", "sse2", "ssse3", "avx2", "avx512"};

constexpr std::uint32_t SSEBits = 1U << 25;
constexpr std::uint32_t SSE2Bits = SSEBits | 1U << 26;
constexpr std::uint32_t SSE3Bit = 1U << 0;
constexpr std::uint32_t SSSE3Bits = SSE3Bit | 1U << 9;
constexpr std::uint32_t AVXBits = SSSE3Bits | 1U << 19 | 1U << 20 | 1U << 23 | 1U << 27 | 1U << 28;
constexpr std::uint32_t AVX2Bit = 1U << 5;
constexpr std::uint32_t AVX512Bits = 1U << 16 | 1U << 17 | 1U << 30 | 1U << 31;
constexpr std::uint32_t VBMIBit = 1U << 1;
constexpr std::uint32_t LongModeBit = 1U << 29;

constexpr char NamedVendor[] = "GenuineIntel";
constexpr char OtherVendor[] = "AuthenticAMD";

struct Processor {
    const char* name;
    const char* vendor;
    std::uint32_t greatestLeaf;
    std::uint32_t leaf1Ecx;
    std::uint32_t leaf1Edx;
    std::uint32_t cores;
    std::uint32_t greatestExtendedLeaf;
    std::uint32_t extended1Edx;
    std::int32_t processorClass;
    std::int32_t index;
};

void PrintTo(const Processor& processor, std::ostream* out) {
    *out << processor.name;
}

ProcessorAnswers MakeAnswers(const Processor& processor) {
    ProcessorAnswers answers;
    answers.greatestLeaf = processor.greatestLeaf;
    std::memcpy(answers.vendor.data(), processor.vendor, answers.vendor.size());
    answers.leaf1Ecx = processor.leaf1Ecx;
    answers.leaf1Edx = processor.leaf1Edx;
    answers.leaf4Eax = (processor.cores - 1) << 26;
    answers.greatestExtendedLeaf = processor.greatestExtendedLeaf;
    answers.extended1Edx = processor.extended1Edx;
    return answers;
}

constexpr std::uint32_t NoExtended = 0x80000000;
constexpr std::uint32_t Extended = 0x80000008;

constexpr Processor Processors[] = {
    {"SSSE3OneCore", NamedVendor, 10, SSSE3Bits, SSE2Bits, 1, Extended, LongModeBit, 33, 2},
    {"SSSE3TwoCores", NamedVendor, 10, SSSE3Bits, SSE2Bits, 2, Extended, LongModeBit, 33, 2},
    {"SSSE3ThreeCores", NamedVendor, 10, SSSE3Bits, SSE2Bits, 3, Extended, LongModeBit, 34, 2},
    {"SSSE3SixtyFourCores", NamedVendor, 10, SSSE3Bits, SSE2Bits, 64, Extended, LongModeBit, 34, 2},
    {"SSSE3WithoutLeaf4CountsOneCore", NamedVendor, 3, SSSE3Bits, SSE2Bits, 64, Extended,
     LongModeBit, 33, 2},
    {"SSSE3OfAnotherVendor", OtherVendor, 13, SSSE3Bits, SSE2Bits, 8, Extended, LongModeBit, 34, 2},
    {"SSSE3Without64BitMode", NamedVendor, 10, SSSE3Bits, SSE2Bits, 1, NoExtended, 0, 33, 2},
    {"NamedVendorWith64BitMode", NamedVendor, 10, SSE3Bit, SSE2Bits, 2, Extended, LongModeBit, 32,
     1},
    {"OtherVendorWith64BitMode", OtherVendor, 1, SSE3Bit, SSE2Bits, 1, Extended, LongModeBit, 68,
     0},
    {"OtherVendorWithoutSSE3", OtherVendor, 1, 0, SSE2Bits, 1, Extended, LongModeBit, 68, 0},
    {"SSE3Without64BitMode", NamedVendor, 10, SSE3Bit, SSE2Bits, 1, Extended, 0, 66, 0},
    {"ExtendedLeafOneMissing", NamedVendor, 10, SSE3Bit, SSE2Bits, 1, NoExtended, LongModeBit, 66,
     0},
    {"NoExtendedLeafAtAll", NamedVendor, 10, SSE3Bit, SSE2Bits, 1, 0, LongModeBit, 66, 0},
    {"SSE2Alone", NamedVendor, 2, 0, SSE2Bits, 1, NoExtended, 0, 65, 0},
    {"SSEAlone", NamedVendor, 2, 0, SSEBits, 1, NoExtended, 0, 64, 0},
    {"NothingAtAll", OtherVendor, 0, 0, 0, 1, 0, 0, 0, 0},
};

class ProcessorTable : public testing::TestWithParam<Processor> {};

TEST_P(ProcessorTable, GivesItsClassAndIndex) {
    const ProcessorAnswers answers = MakeAnswers(GetParam());

    EXPECT_EQ(CalculateProcessorClass(answers), GetParam().processorClass);
    EXPECT_EQ(CalculateKernelIndex(CalculateProcessorClass(answers)), GetParam().index);
}

INSTANTIATE_TEST_SUITE_P(All, ProcessorTable, testing::ValuesIn(Processors),
                         [](const auto& row) { return std::string(row.param.name); });

TEST(KernelIndex, IsOneForClass32AndTwoForClasses33To35AndElseZero) {
    for (std::int32_t processorClass = -1; processorClass < 100; ++processorClass) {
        const bool isSecond = processorClass >= 33 && processorClass <= 35;
        const std::int32_t expected = processorClass == 32 ? 1 : (isSecond ? 2 : 0);
        EXPECT_EQ(CalculateKernelIndex(processorClass), expected) << processorClass;
    }
}

TEST(ProcessorClass, TakesAVendorForTheNamedOneOnlyByAllTwelveLetters) {
    ProcessorAnswers answers = MakeAnswers(Processors[7]);
    answers.vendor.back() = 'x';

    EXPECT_EQ(CalculateProcessorClass(answers), 68);
}

TEST(ProcessorClass, CountsCoresByTheTopSixBitsOfLeaf4Alone) {
    ProcessorAnswers answers = MakeAnswers(Processors[1]);
    answers.leaf4Eax |= (1U << 26) - 1;
    EXPECT_EQ(CalculateProcessorClass(answers), 33);

    answers = MakeAnswers(Processors[2]);
    answers.leaf4Eax |= (1U << 26) - 1;
    EXPECT_EQ(CalculateProcessorClass(answers), 34);
}

ProcessorAnswers MakeWideProcessor() {
    ProcessorAnswers answers = MakeAnswers(Processors[2]);
    answers.greatestLeaf = 20;
    answers.leaf1Ecx = AVXBits;
    answers.leaf7Ebx = AVX2Bit | AVX512Bits;
    answers.leaf7Ecx = VBMIBit;
    answers.keptStates = 0xE7;
    return answers;
}

TEST(WideRegisters, AreUsedWhereProcessorAndOperatingSystemHaveThem) {
    EXPECT_TRUE(HasAVX2(MakeWideProcessor()));
    EXPECT_TRUE(HasAVX512(MakeWideProcessor()));
}

TEST(WideRegisters, AreLeftAloneWhereTheOperatingSystemDoesNotKeepThem) {
    ProcessorAnswers answers = MakeWideProcessor();

    answers.keptStates = 0x07;
    EXPECT_TRUE(HasAVX2(answers));
    EXPECT_FALSE(HasAVX512(answers));
    answers.keptStates = 0x67;  // The upper sixteen registers are not kept.
    EXPECT_FALSE(HasAVX512(answers));
    answers.keptStates = 0x03;
    EXPECT_FALSE(HasAVX2(answers));
    answers.keptStates = 0;
    EXPECT_FALSE(HasAVX2(answers));
    EXPECT_TRUE(HasSSSE3(answers));
}

TEST(WideRegisters, NeedEveryOneOfTheirFeatures) {
    for (const std::uint32_t bit : {0U, 9U, 19U, 20U, 23U, 27U, 28U}) {
        ProcessorAnswers answers = MakeWideProcessor();
        answers.leaf1Ecx &= ~(1U << bit);
        EXPECT_FALSE(HasAVX2(answers)) << bit;
        EXPECT_FALSE(HasAVX512(answers)) << bit;
    }
    for (const std::uint32_t bit : {16U, 17U, 30U, 31U}) {
        ProcessorAnswers answers = MakeWideProcessor();
        answers.leaf7Ebx &= ~(1U << bit);
        EXPECT_TRUE(HasAVX2(answers)) << bit;
        EXPECT_FALSE(HasAVX512(answers)) << bit;
    }
    ProcessorAnswers answers = MakeWideProcessor();
    answers.leaf7Ecx = 0;
    EXPECT_FALSE(HasAVX512(answers));
    answers.leaf7Ebx = AVX512Bits;
    EXPECT_FALSE(HasAVX2(answers));
}

/// Leaves the choice to the library, whatever the tests before asked for.
class Selection : public testing::Test {
  protected:
    void SetUp() override { ASSERT_TRUE(ForceKernels("")); }
    void TearDown() override {
        EXPECT_TRUE(ForceKernels(""));
        variable.Set(named.empty() ? nullptr : named.c_str());
        SelectKernels();
    }
    void NameByVariable(const char* name) const {
        variable.Set(name);
        SelectKernels();
    }

    std::string named =
        std::getenv("ZENTARA_KERNELS") == nullptr ? "" : std::getenv("ZENTARA_KERNELS");
    ScopedVariable variable{"ZENTARA_KERNELS", nullptr};
};

std::int32_t GetIndexOf(const std::string& name) {
    if (name == "plain") return 0;
    return name == "sse2" ? 1 : 2;
}

TEST(SelectionOfThisRun, IsTheOneThatTheRunExpects) {
    const char* const index = std::getenv("ZENTARA_EXPECT_KERNEL_INDEX");
    const char* const form = std::getenv("ZENTARA_KERNELS");
    ASSERT_TRUE(ForceKernels(""));
    SelectKernels();

    if (index != nullptr) {
        EXPECT_EQ(std::to_string(GetKernelIndex()), index);
    }
    if (form != nullptr) {
        EXPECT_STREQ(GetRowKernels().name, form);
    }
}

TEST_F(Selection, FollowsTheProcessor) {
    SelectKernels();

    const ProcessorAnswers answers = AskProcessor();
    EXPECT_EQ(GetKernelIndex(), CalculateKernelIndex(CalculateProcessorClass(answers)));
    EXPECT_EQ(GetKernelIndex(), GetIndexOf(GetRowKernels().name));
}

TEST_F(Selection, TakesTheBestFormOfItsIndex) {
    SelectKernels();

    const ProcessorAnswers answers = AskProcessor();
    const char* const widest =
        HasAVX512(answers) ? "avx512" : (HasAVX2(answers) ? "avx2" : "ssse3");
    const char* const forms[] = {"plain", "sse2", widest};
    EXPECT_STREQ(GetRowKernels().name, forms[GetKernelIndex()]);
}

TEST_F(Selection, HoldsEveryFormThatTheProcessorHas) {
    const ProcessorAnswers answers = AskProcessor();

    EXPECT_NE(FindRowKernels("plain"), nullptr);
    EXPECT_EQ(FindRowKernels("sse2") != nullptr, HasSSE2(answers));
    EXPECT_EQ(FindRowKernels("ssse3") != nullptr, HasSSSE3(answers));
    EXPECT_EQ(FindRowKernels("avx2") != nullptr, HasAVX2(answers));
    EXPECT_EQ(FindRowKernels("avx512") != nullptr, HasAVX512(answers));
}

TEST_F(Selection, ForcesEachFormThatTheProcessorHasAndRefusesTheOthers) {
    SelectKernels();
    const RowKernels* const chosen = &GetRowKernels();
    for (const char* const name : FormNames) {
        const RowKernels* const rows = FindRowKernels(name);
        ASSERT_EQ(ForceKernels(name), rows != nullptr) << name;
        EXPECT_EQ(&GetRowKernels(), rows == nullptr ? chosen : rows) << name;
        if (rows != nullptr) {
            EXPECT_EQ(GetKernelIndex(), GetIndexOf(name));
        }
        ASSERT_TRUE(ForceKernels(""));
    }
    EXPECT_EQ(&GetRowKernels(), chosen);
}

TEST_F(Selection, RefusesAnUnknownFormAndKeepsTheOneInForce) {
    ASSERT_TRUE(ForceKernels("plain"));

    EXPECT_FALSE(ForceKernels("neon"));
    EXPECT_FALSE(ForceKernels("PLAIN"));
    EXPECT_FALSE(ForceKernels("plain "));
    EXPECT_FALSE(ForceKernels(std::string_view("plain\0", 6)));
    EXPECT_STREQ(GetRowKernels().name, "plain");
    EXPECT_EQ(FindRowKernels("neon"), nullptr);
    EXPECT_EQ(FindRowKernels(""), nullptr);
}

TEST_F(Selection, KeepsAForcedFormWhenAPipelineIsMade) {
    ASSERT_TRUE(ForceKernels("plain"));

    const ZImagePipeline pipeline;

    EXPECT_STREQ(GetRowKernels().name, "plain");
}

TEST_F(Selection, TakesTheFormThatTheVariableNames) {
    for (const char* const name : FormNames) {
        if (FindRowKernels(name) == nullptr) continue;
        NameByVariable(name);
        EXPECT_STREQ(GetRowKernels().name, name);
        EXPECT_EQ(GetKernelIndex(), GetIndexOf(name));
    }
}

TEST_F(Selection, LeavesTheChoiceToTheProcessorWhereTheVariableNamesNoForm) {
    SelectKernels();
    const RowKernels* const chosen = &GetRowKernels();

    for (const char* const name : {"", "neon", "2"}) {
        NameByVariable("plain");
        NameByVariable(name);
        EXPECT_EQ(&GetRowKernels(), chosen) << name;
    }
}

TEST_F(Selection, LeavesTheChoiceToTheProcessorWhereTheVariableNamesAFormThatItLacks) {
    SelectKernels();
    const RowKernels* const chosen = &GetRowKernels();
    int lacking = 0;

    for (const char* const name : FormNames) {
        if (FindRowKernels(name) != nullptr) continue;
        ++lacking;
        NameByVariable("plain");
        NameByVariable(name);
        EXPECT_EQ(&GetRowKernels(), chosen) << name;
    }

    if (lacking == 0) GTEST_SKIP() << "this processor has every form";
}

TEST_F(Selection, IsMadeByEveryPipeline) {
    NameByVariable("plain");
    variable.Set(nullptr);

    const ZImagePipeline pipeline;

    EXPECT_EQ(GetKernelIndex(), CalculateKernelIndex(CalculateProcessorClass(AskProcessor())));
}

TEST_F(Selection, StaysTheSameHoweverOftenAndWhereItIsMade) {
    SelectKernels();
    const RowKernels* const chosen = &GetRowKernels();

    std::vector<std::thread> threads;
    for (int index = 0; index < 4; ++index) {
        threads.emplace_back([chosen] {
            for (int round = 0; round < 100; ++round) {
                SelectKernels();
                EXPECT_EQ(&GetRowKernels(), chosen);
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
}

}  // namespace
}  // namespace ZV

#pragma once

#include <cstdint>
#include <string_view>

#include "imaging/kernels/row_kernels.h"

namespace ZV {

/// Chooses the form of the kernels by the processor, or the one that the environment variable
/// ZENTARA_KERNELS names (plain, sse2, ssse3, avx2, avx512); a form that is unknown or that the
/// processor lacks is not taken. Every pipeline calls it when it is made; the choice is the same
/// each time. Thread-safe.
void SelectKernels();

/// Takes the form of this name for the whole process until the next call; empty gives the choice
/// back to SelectKernels. False, and nothing changes, for a form that is unknown or that the
/// processor lacks. For tests and measurements.
[[nodiscard]] bool ForceKernels(std::string_view name);

/// 0 plain, 1 SSE2, 2 SSSE3 and beyond.
[[nodiscard]] std::int32_t GetKernelIndex();

/// The form in force; its name tells which. SelectKernels is not needed before.
[[nodiscard]] const RowKernels& GetRowKernels();

/// The form of this name, whatever is in force; null for one that is unknown or that the processor
/// lacks.
[[nodiscard]] const RowKernels* FindRowKernels(std::string_view name);

}  // namespace ZV

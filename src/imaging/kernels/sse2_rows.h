#pragma once

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"

/// Row loops of the SSE2 form that forms for later processors take over, since the instructions
/// behind SSE2 add nothing to them. Contracts are those of the fields of RowKernels.
namespace ZV::SSE2Rows {

void Pack8x4(const std::uint8_t* const planes[4], std::uint8_t* pixels, std::size_t count);

void Add8(const std::uint8_t* source, std::uint8_t* samples, std::size_t count);
void Add16(const Word* source, Word* samples, std::size_t count);

void ShiftRight8(std::int32_t shift, std::uint8_t* samples, std::size_t count);
void ShiftRight16(std::int32_t shift, Word* samples, std::size_t count);

void Lookup8x1(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
void Lookup8x3(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
void Lookup8x4(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
void Lookup16x1(const std::uint16_t* tables, Word* samples, std::size_t count);
void Lookup16x3(const std::uint16_t* tables, Word* samples, std::size_t count);

void Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count);
void Double16(const Word* row, Word* output, std::size_t count);

void LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                   std::uint8_t* output, std::size_t count);
void LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                    Word* output, std::size_t count);
void LinearColumnPair8(const std::uint16_t* upper, const std::uint16_t* lower,
                       const std::int32_t weights[2], std::uint8_t* const outputs[2],
                       std::size_t count);
void LinearColumnPair16(const std::uint16_t* upper, const std::uint16_t* lower,
                        const std::int32_t weights[2], Word* const outputs[2], std::size_t count);

void CubicColumn8(const float* const rows[4], const CubicWeights& weights, std::uint8_t* output,
                  std::size_t count);
void CubicColumn16(const float* const rows[4], const CubicWeights& weights, Word* output,
                   std::size_t count);
void CubicColumnPair8(const float* const rows[4], const CubicWeights weights[2],
                      std::uint8_t* const outputs[2], std::size_t count);
void CubicColumnPair16(const float* const rows[4], const CubicWeights weights[2],
                       Word* const outputs[2], std::size_t count);

void Split8(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd, std::size_t count);

void AddHalves8(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* output,
                std::size_t count);
void AddHalves16(const Word* first, const Word* second, Word* output, std::size_t count);

}  // namespace ZV::SSE2Rows

#pragma once

#include <cstdint>
#include <span>

#include "api/camera_context.h"
#include "api/parameter_table.h"
#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// What Zentara_GetInfo tells of a camera: one row per key, with everything that is known of it.
/// Answers, the log and the generated documentation all go by these rows.

/// Whom an answer is about.
struct InformationSource {
    ZCamera& camera;
    CameraContext* context;  ///< Null after a close that failed.
};

using InformationAnswer = ZentaraResult (*)(const InformationSource& source, std::uint32_t* value);

struct InformationRow {
    std::uint32_t key;
    /// As in zentara.h and in the log's table of key names; null for a key that has none there.
    const char* name;
    const char* unit;  ///< "" where a value is a plain number or a choice.
    const char* meaning;
    const char* label;                   ///< Of the log's line.
    InformationAnswer answer = nullptr;  ///< Null: not implemented.
    LogForm form = LogForm::Number;
    std::span<const ValueName> values = {};
};

/// All rows, row k being key k.
[[nodiscard]] std::span<const InformationRow> GetInformationRows();

/// The row of a key; null beyond the last.
[[nodiscard]] const InformationRow* FindInformationRow(std::uint32_t key);

}  // namespace ZV

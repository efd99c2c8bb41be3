#include "simulation/fault_reader.h"

#include <string>

#include "hal/control_records.h"

namespace ZV::Simulation {
namespace {

// What a fault of a kind meets, and with that the keys that it may have.
enum class Meets { Request, Frame, Packet, RequestOrPacket };

struct KindRow {
    std::string_view name;
    FaultKind kind;
    Meets meets;
};
constexpr KindRow Kinds[] = {
    {"failRequest", FaultKind::FailRequest, Meets::Request},
    {"answerAtOnce", FaultKind::AnswerAtOnce, Meets::Request},
    {"neverComplete", FaultKind::NeverComplete, Meets::Request},
    {"shortAnswer", FaultKind::ShortAnswer, Meets::Request},
    {"plug", FaultKind::Plug, Meets::Request},
    {"losePacket", FaultKind::LosePacket, Meets::Packet},
    {"repeatPacket", FaultKind::RepeatPacket, Meets::Packet},
    {"truncatePacket", FaultKind::TruncatePacket, Meets::Packet},
    {"corruptPacket", FaultKind::CorruptPacket, Meets::Packet},
    {"missingTail", FaultKind::MissingTail, Meets::Packet},
    {"overwriteRequest", FaultKind::OverwriteRequest, Meets::Packet},
    {"frameStart", FaultKind::FrameStart, Meets::Packet},
    {"busReset", FaultKind::BusReset, Meets::RequestOrPacket},
    {"unplug", FaultKind::Unplug, Meets::RequestOrPacket},
    {"wrongPsn", FaultKind::WrongPsn, Meets::Frame},
};

constexpr const char* RequestKeys[] = {"code", "address", "request", "error", "pended"};
constexpr const char* PacketKeys[] = {"packet", "offset"};

void ReadKind(const JsonNode& node, FaultDescription* fault) {
    std::string names;
    for (const KindRow& row : Kinds) {
        if (node.GetValue() == row.name) {
            fault->kind = row.kind;
            return;
        }
        names += (names.empty() ? "" : ", ") + std::string(row.name);
    }
    node.Fail("one of these is wanted: " + names);
}

// A code stands as its name or as its number.
void ReadCode(const JsonNode& node, FaultDescription* fault) {
    for (const ControlCodeName& row : ControlCodeNames) {
        if (node.GetValue() == row.name) {
            fault->code = row.code;
            return;
        }
    }
    node.Get(&fault->code, 1);
}

void ReadAddress(const JsonNode& node, FaultDescription* fault) {
    fault->hasAddress = true;
    node.Get(&fault->address);
}

void ReadPacket(const JsonNode& node, FaultDescription* fault) {
    fault->hasPacket = true;
    node.Get(&fault->packet);
}

void ReadBytes(const JsonNode& node, FaultDescription* fault) {
    fault->hasBytes = true;
    node.Get(&fault->bytes, 0, 65535);
}

constexpr JsonKey<FaultDescription> Keys[] = {
    {"kind", ReadKind},
    {"code", ReadCode},
    {"address", ReadAddress},
    {"request",
     [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->request, 1); }},
    {"frame", [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->frame, 1); }},
    {"packet", ReadPacket},
    {"count", [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->count); }},
    {"probability",
     [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->probability, 0, 1); }},
    {"error", [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->error, 1); }},
    {"pended", [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->isPended); }},
    {"bytes", ReadBytes},
    {"offset",
     [](const JsonNode& node, FaultDescription* fault) { node.Get(&fault->offset, 0, 65535); }},
};

Meets GetMeets(FaultKind kind) {
    for (const KindRow& row : Kinds) {
        if (row.kind == kind) return row.meets;
    }
    return Meets::Packet;
}

void RefuseKeys(const JsonNode& node, std::span<const char* const> keys) {
    for (const char* key : keys) {
        if (node.Has(key)) node.GetChild(key).Fail("does not go with a fault of this kind");
    }
}

void CheckKeys(const JsonNode& node, Meets meets) {
    constexpr const char* FrameKeys[] = {"frame"};
    if (meets == Meets::RequestOrPacket && !node.Has("request") && !node.Has("code")) {
        meets = Meets::Packet;
    }
    if (meets == Meets::Packet) return RefuseKeys(node, RequestKeys);
    RefuseKeys(node, PacketKeys);
    RefuseKeys(node, meets == Meets::Frame ? std::span<const char* const>(RequestKeys)
                                           : std::span<const char* const>(FrameKeys));
}

}  // namespace

void ReadFault(const JsonNode& node, FaultDescription* fault) {
    ReadObject<FaultDescription>(node, Keys, fault);
    if (node.HasFailed()) return;
    if (!node.Has("kind")) return node.Fail("the key \"kind\" is missing");
    CheckKeys(node, GetMeets(fault->kind));
}

}  // namespace ZV::Simulation

// One frame from request buffers to its own buffer, against memcpy of the same bytes between the
// same buffers. The counter `ratio` is the assembler's time over that of memcpy, measured in turns.

#include "hal/stream_assembler.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <vector>

#include "hal/frame_info.h"
#include "hal/stream_format.h"
#include "simulation/packet_stream.h"

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

struct Slot {
    std::size_t payload;  ///< Offset in the memory.
    std::uint32_t length;
    std::size_t data;  ///< Offset of its image bytes, for memcpy.
    std::uint32_t dataBytes;
};

constexpr std::size_t PlainFirstData = PlainHeaderBytes + FrameHeaderBytes;
constexpr std::size_t BlocksFirstData = CipHeaderBytes + SourcePacketHeaderBytes;

/// A frame cut into packets, laid out as in the request buffers, and the record that it goes to.
class Stream {
  public:
    Stream(std::uint32_t version, std::uint32_t packetBytes, std::uint32_t width,
           std::uint32_t height)
        : pixels(std::size_t{width} * height * 2) {
        Simulation::OutgoingFrame frame;
        frame.pixels.assign(pixels.size(), 0x5A);
        frame.rowBytes = width * 2;
        frame.sampleBits = 15;
        Simulation::PacketStream packets(version, packetBytes);
        packets.Begin(std::move(frame));
        const std::size_t stride = packetBytes + PacketSlotExtraBytes;
        while (!packets.IsFinished()) {
            const std::size_t slot = memory.size();
            memory.resize(slot + stride);
            AddSlot(version, slot + PacketPayloadOffset,
                    packets.Next(memory.data() + slot + PacketPayloadOffset));
        }
        record.buffer = pixels.data();
        record.bufferSize = static_cast<std::uint32_t>(pixels.size());
        record.bytesExpected = record.bufferSize;
        fresh = memory;
        assembler.SetCallbacks(&GetRecord, &GetRecord, &CountFrame, nullptr, this);
        assembler.StartStream(static_cast<std::uint8_t>(version));
    }

    /// Headers are reversed in place while a packet is parsed: they are laid out anew, outside the
    /// measurement.
    void Rewind() {
        for (const Slot& slot : slots) {
            std::memcpy(memory.data() + slot.payload, fresh.data() + slot.payload,
                        slot.data - slot.payload);
            const std::size_t tail = slot.payload + slot.length - TailMarkBytes;
            std::memcpy(memory.data() + tail, fresh.data() + tail, TailMarkBytes);
        }
        assembler.blockCounter = 0;
    }

    void Assemble() {
        for (const Slot& slot : slots) {
            assembler.ParsePacket(memory.data() + slot.payload, slot.length);
        }
        benchmark::ClobberMemory();
    }

    void Copy() {
        std::uint8_t* to = pixels.data();
        for (const Slot& slot : slots) {
            std::memcpy(to, memory.data() + slot.data, slot.dataBytes);
            to += slot.dataBytes;
        }
        benchmark::ClobberMemory();
    }

    [[nodiscard]] std::size_t GetFrameBytes() const { return pixels.size(); }
    [[nodiscard]] std::uint64_t GetFrameCount() const { return frames; }
    [[nodiscard]] bool IsLastFrameComplete() const { return record.frameStatus == FrameComplete; }

  private:
    void AddSlot(std::uint32_t version, std::size_t payload, std::uint32_t length) {
        const bool isFirst = (memory[payload] & PlainFlagFirst) != 0;
        const std::size_t plainData = isFirst ? PlainFirstData : PlainHeaderBytes;
        const std::size_t before = version == 0 ? BlocksFirstData : plainData;
        const std::size_t behind = version == 0 ? 0 : TailMarkBytes;
        const std::size_t due = pixels.size() - bytesSent;
        const std::size_t dataBytes = std::min(due, length - before - behind);
        slots.push_back({payload, length, payload + before, static_cast<std::uint32_t>(dataBytes)});
        bytesSent += dataBytes;
    }

    static tStFrameInfo* GetRecord(void* self) { return &static_cast<Stream*>(self)->record; }
    static void CountFrame(void* self) { ++static_cast<Stream*>(self)->frames; }

    std::vector<std::uint8_t> memory;
    std::vector<std::uint8_t> fresh;
    std::vector<std::uint8_t> pixels;
    std::vector<Slot> slots;
    std::size_t bytesSent = 0;
    tStFrameInfo record;
    std::uint64_t frames = 0;
    StreamAssembler assembler;
};

double MeasureSeconds(Stream& stream, void (Stream::*step)()) {
    stream.Rewind();
    const auto begin = Clock::now();
    (stream.*step)();
    return std::chrono::duration<double>(Clock::now() - begin).count();
}

double GetMedian(std::vector<double> values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

void AssembleFrame(benchmark::State& state) {
    Stream stream(
        static_cast<std::uint32_t>(state.range(0)), static_cast<std::uint32_t>(state.range(1)),
        static_cast<std::uint32_t>(state.range(2)), static_cast<std::uint32_t>(state.range(3)));
    std::vector<double> copySeconds;
    std::vector<double> assembleSeconds;
    std::vector<double> ratios;
    for (auto _ : state) {
        copySeconds.push_back(MeasureSeconds(stream, &Stream::Copy));
        assembleSeconds.push_back(MeasureSeconds(stream, &Stream::Assemble));
        ratios.push_back(assembleSeconds.back() / copySeconds.back());
        state.SetIterationTime(assembleSeconds.back());
    }
    if (stream.GetFrameCount() != assembleSeconds.size() || !stream.IsLastFrameComplete()) {
        state.SkipWithError("a frame was not complete");
        return;
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(stream.GetFrameBytes()) * state.iterations());
    state.counters["memcpy_us"] = GetMedian(copySeconds) * 1e6;
    state.counters["assembler_us"] = GetMedian(assembleSeconds) * 1e6;
    state.counters["ratio"] = GetMedian(ratios);
}

void AllStreams(benchmark::internal::Benchmark* benchmark) {
    benchmark->ArgNames({"version", "packet", "width", "height"});
    for (const int version : {0, 1, 2}) {
        for (const int packetBytes : {4096, 8192}) {
            benchmark->Args({version, packetBytes, 1392, 1040});
            benchmark->Args({version, packetBytes, 4008, 2672});
        }
    }
}

BENCHMARK(AssembleFrame)->Apply(AllStreams)->UseManualTime()->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace ZV

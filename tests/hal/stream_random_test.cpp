// Packets of any contents and any order: no byte outside a buffer, no record lost or kept.

#include <array>
#include <random>

#include "stream_fixture.h"

namespace ZV::Testing {
namespace {

constexpr std::uint32_t Seed = 20260727;

/// A camera that gives out records of every shape for ever and checks each when it comes back.
class RandomWorld {
  public:
    RandomWorld() {
        assembler.SetCallbacks([](void* self) { return static_cast<RandomWorld*>(self)->Take(); },
                               [](void* self) { return static_cast<RandomWorld*>(self)->Peek(); },
                               [](void* self) { static_cast<RandomWorld*>(self)->Done(); },
                               [](void* self) { static_cast<RandomWorld*>(self)->Done(); }, this);
    }

    std::uint32_t Draw(std::uint32_t below) { return static_cast<std::uint32_t>(random()) % below; }

    Bytes DrawBytes(std::size_t length) {
        Bytes bytes(length);
        for (std::uint8_t& byte : bytes) byte = static_cast<std::uint8_t>(Draw(256));
        return bytes;
    }

    void Send() {
        Bytes packet = DrawPacket();
        const auto memory = std::make_unique<std::uint8_t[]>(packet.size());
        std::copy(packet.begin(), packet.end(), memory.get());
        assembler.ParsePacket(memory.get(), static_cast<std::uint32_t>(packet.size()));
        if (Draw(5000) == 0) assembler.StartStream(static_cast<std::uint8_t>(Draw(4)));
        if (Draw(3000) == 0) assembler.AbandonFrame();
    }

    void Check() const {
        if (frame != nullptr) {
            ASSERT_TRUE(frame->AreGuardsIntact());
            ASSERT_EQ(frame->info.isHeld, assembler.current == &frame->info);
        }
    }

    StreamAssembler assembler;
    std::uint32_t framesDone = 0;

  private:
    Bytes DrawPacket() {
        if (Draw(10) == 0) return DrawBytes(Draw(120));
        Header header;
        header.psn = Draw(20) == 0 ? 1 : 0;
        header.plane = static_cast<std::uint8_t>(Draw(3) == 0 ? Draw(16) : nextPlane);
        nextPlane = nextPlane == 0 ? 1 : nextPlane == 1 ? 3 : 0;
        header.sampleBits = static_cast<std::uint8_t>(Draw(16));
        header.field = static_cast<std::uint8_t>(Draw(4));
        header.blockPayload = static_cast<std::uint16_t>(Draw(60));
        const Bytes data = DrawBytes(Draw(90));
        if (assembler.streamingVersion == 0) {
            if (Draw(3) != 0) count = static_cast<std::uint8_t>(count + 1);
            const auto size = static_cast<std::uint8_t>(Draw(10));
            const auto shift = static_cast<std::uint8_t>(Draw(4));
            return BlocksStart(count, size, shift) + SourceStart(Draw(3) == 0, header) + data;
        }
        if (Draw(4) == 0) return FirstPacket(number = DrawNumber(), header, data);
        const std::uint32_t offset =
            Draw(4) == 0 ? Draw(0x1000000) : assembler.expectedOffset + Draw(2) * Draw(40);
        return PlainPacket(Draw(20) == 0 ? DrawNumber() : number, offset, data);
    }

    std::uint8_t DrawNumber() { return static_cast<std::uint8_t>(Draw(4)); }

    tStFrameInfo* Peek() {
        if (Draw(30) == 0) return nullptr;
        frame = std::make_unique<GuardedFrame>(Draw(600));
        tStFrameInfo& info = frame->info;
        constexpr std::array Layouts{0, 0, 0, 0, 2, 3, 4, 5, 6, 1, 7, -1};
        info.fieldIndex = Layouts[Draw(Layouts.size())];
        info.interlaced = Draw(2) == 0;
        info.rowBytes = static_cast<std::uint16_t>(Draw(50));
        const std::uint32_t parts = 1 + Draw(4);
        info.bytesExpected = Draw(8) == 0 ? Draw(2000) : info.bufferSize / parts;
        if (Draw(50) == 0) info.buffer = nullptr;
        info.isHeld = true;
        return &info;
    }

    tStFrameInfo* Take() { return Draw(30) == 0 ? nullptr : &frame->info; }

    void Done() {
        ++framesDone;
        if (frame == nullptr) return;
        EXPECT_FALSE(frame->info.isHeld);
        EXPECT_TRUE(frame->AreGuardsIntact());
    }

    std::mt19937 random{Seed};
    std::unique_ptr<GuardedFrame> frame;
    std::uint8_t nextPlane = 0;
    std::uint8_t number = 0;
    std::uint8_t count = 0;
};

TEST(StreamRandom, PacketsOfAnyContentsNeverWriteOutsideABuffer) {
    RandomWorld world;
    world.assembler.StartStream(1);

    for (int packet = 0; packet < 200000; ++packet) {
        world.Send();
        world.Check();
        if (testing::Test::HasFailure()) FAIL() << "seed " << Seed << " packet " << packet;
    }

    EXPECT_GT(world.framesDone, 1000U);
}

/// Every byte of a frame is 0 or a byte that a packet brought: never what the buffer held before.
TEST(StreamRandom, AFrameNeverShowsWhatItsBufferHeld) {
    constexpr std::uint8_t Sent = 0x11;
    std::mt19937 random{Seed};
    const auto draw = [&](std::uint32_t below) {
        return static_cast<std::uint32_t>(random()) % below;
    };
    struct World {
        std::unique_ptr<GuardedFrame> frame;
        std::uint32_t done = 0;
    } world;
    StreamAssembler assembler;
    assembler.SetCallbacks([](void* self) { return &static_cast<World*>(self)->frame->info; },
                           [](void* self) { return &static_cast<World*>(self)->frame->info; },
                           [](void* self) { ++static_cast<World*>(self)->done; }, nullptr, &world);

    for (int round = 0; round < 20000; ++round) {
        const std::uint32_t parts = 1 + draw(4);
        world.frame = std::make_unique<GuardedFrame>(1 + draw(300));
        world.done = 0;
        tStFrameInfo& info = world.frame->info;
        info.fieldIndex = std::array{0, 0, 0, 2, 3, 4, 5, 6}[draw(8)];
        info.interlaced = draw(2) == 0;
        info.rowBytes = static_cast<std::uint16_t>(draw(30));
        info.bytesExpected = info.bufferSize / parts;
        const auto version = static_cast<std::uint8_t>(1 + draw(2));
        assembler.StartStream(version);
        Header header;
        header.sampleBits = draw(2) == 0 ? 7 : 15;

        // First field or planes, each cut off anywhere, then the start of another frame.
        for (const int plane : {0, 1, 3}) {
            header.plane = static_cast<std::uint8_t>(plane);
            header.field = plane == 1 && info.interlaced && draw(2) == 0 ? 0 : 1;
            Bytes packet = FirstPacket(1, header, Bytes(draw(120), Sent));
            assembler.ParsePacket(packet.data(), static_cast<std::uint32_t>(packet.size()));
            if (world.done != 0 || draw(3) == 0) break;
            Bytes next = PlainPacket(1, assembler.expectedOffset, Bytes(draw(60), Sent));
            assembler.ParsePacket(next.data(), static_cast<std::uint32_t>(next.size()));
            if (world.done != 0) break;
        }
        if (world.done == 0) {
            header.field = 2;
            header.plane = 5;
            Bytes other = FirstPacket(2, header, Bytes{});
            const GuardedFrame* first = world.frame.get();
            assembler.ParsePacket(other.data(), static_cast<std::uint32_t>(other.size()));
            EXPECT_EQ(first, world.frame.get());
        }

        ASSERT_NE(world.done, 0U);
        for (const std::uint8_t byte : world.frame->Pixels()) {
            ASSERT_TRUE(byte == 0 || byte == Sent) << "seed " << Seed << " round " << round;
        }
        assembler.current = nullptr;
    }
}

}  // namespace
}  // namespace ZV::Testing

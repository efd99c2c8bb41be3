#include "camera/test_camera.h"

#include <algorithm>

#include "imaging/ex_image.h"
#include "imaging/image_pipeline.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

bool IsBlack(const ZExImage& image) {
    const std::uint8_t* const pixels = image.GetImageData();
    return std::all_of(pixels, pixels + image.GetImageSize(), [](auto byte) { return byte == 0; });
}

}  // namespace

CameraResult TestCamera::Ready() {
    CameraResult result = OpenCamera();
    if (result == CameraOk) result = ReadCameraInfo();
    if (result == CameraOk) result = SetupNormalizedGain();
    if (result == CameraOk) result = SetupControlRegisters(registers.control);
    if (result == CameraOk) imagePipeline->Setup(GetCCDWidth(), GetCCDHeight());
    return result;
}

CameraWorld::CameraWorld(std::string_view scenario) : world(scenario) {
    HALCamera* list = nullptr;
    std::uint32_t count = 0;
    (void)HAL_CameraGetList(&list, MorvaneFWCamera::m_cameraModelAddress,
                            MorvaneFWCamera::m_cameraModelAddressAlt, 10, &count);
    if (count > 0) camera = std::make_unique<TestCamera>(list[0]);
    for (std::uint32_t other = 1; other < count; ++other) (void)HAL_CameraRelease(&list[other]);
    (void)HAL_MemoryFree(list);
}

std::vector<RegisterWrite> CameraWorld::TakeWrites() {
    std::vector<RegisterWrite> writes = world.ReadRegisterWrites();
    const std::size_t all = writes.size();
    writes.erase(writes.begin(), writes.begin() + static_cast<std::ptrdiff_t>(writesTaken));
    writesTaken = all;
    return writes;
}

void* TestClient::ReceiveImage(ZImageReceivedCallbackStruct* record) {
    auto& client = *static_cast<TestClient*>(record->refCon);
    client.isInCallback = true;
    (void)WaitUntil([&] { return !client.isBlocked; }, std::chrono::minutes(5));
    {
        const std::lock_guard hold(client.mutex);
        const ZExImage* image = record->image;
        if (image != nullptr) {
            client.deliveries.push_back(
                {true, record->status, image->GetImageFormat(), image->GetWidth(),
                 image->GetHeight(), image->GetImageSize(), image->GetCamera(), IsBlack(*image)});
        } else {
            client.deliveries.push_back({false, record->status, 0, 0, 0, 0, nullptr, false});
        }
    }
    ZCamera::FreeImage(record->image);
    client.isInCallback = false;
    ++client.imageCount;
    return nullptr;
}

void* TestClient::ExposeDone(void* refCon) {
    ++static_cast<TestClient*>(refCon)->exposeCount;
    return nullptr;
}

std::vector<TestClient::Delivery> TestClient::GetDeliveries() const {
    const std::lock_guard hold(mutex);
    return deliveries;
}

}  // namespace ZV::Test

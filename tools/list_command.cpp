#include <fmt/format.h>

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "commands.h"
#include "driver.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

struct ListedCamera {
    Zentara_CamListItem item{};
    bool isFree = false;
    std::string model, serialNumber;
    std::uint32_t width = 0, height = 0;
};

ListedCamera Describe(const Zentara_CamListItem& item) {
    ListedCamera listed;
    listed.item = item;
    Camera camera;
    listed.isFree = camera.Open(item.cameraId) == zerrNone;
    if (!listed.isFree) return listed;
    listed.model = camera.GetModelName();
    listed.serialNumber = camera.GetSerialNumber();
    listed.width = camera.GetInfo(zinfCcdWidth).value_or(0);
    listed.height = camera.GetInfo(zinfCcdHeight).value_or(0);
    return listed;
}

nlohmann::json ToJson(const ListedCamera& camera) {
    return {{"id", camera.item.cameraId},
            {"type", camera.item.cameraType},
            {"uniqueId", camera.item.uniqueId},
            {"free", camera.isFree},
            {"model", camera.model},
            {"serialNumber", camera.serialNumber},
            {"sensorWidth", camera.width},
            {"sensorHeight", camera.height}};
}

void PrintTable(const std::vector<ListedCamera>& cameras) {
    if (cameras.empty()) {
        Print("No cameras.\n");
        return;
    }
    Print(fmt::format("{:>3}  {:<14} {:<12} {:<10} {}\n", "Id", "Model", "Sensor", "Unique id",
                      "Serial number"));
    for (const ListedCamera& camera : cameras) {
        const std::string size =
            camera.isFree ? fmt::format("{} x {}", camera.width, camera.height) : "busy";
        Print(fmt::format(
            "{:>3}  {:<14} {:<12} {:08x}   {}\n", camera.item.cameraId,
            camera.isFree ? camera.model : fmt::format("type {}", camera.item.cameraType), size,
            camera.item.uniqueId, camera.serialNumber));
    }
}

}  // namespace

ExitCode RunList(const CommonOptions& common) {
    Driver driver;
    if (driver.GetLoadResult() != zerrNone) {
        PrintError("the library cannot be loaded: " + DescribeResult(driver.GetLoadResult()));
        return ExitFailed;
    }
    std::vector<Zentara_CamListItem> items;
    const ZentaraResult result = driver.List(&items);
    std::vector<ListedCamera> cameras;
    cameras.reserve(items.size());
    for (const Zentara_CamListItem& item : items) cameras.push_back(Describe(item));
    if (common.asJson) {
        nlohmann::json list = nlohmann::json::array();
        for (const ListedCamera& camera : cameras) list.push_back(ToJson(camera));
        PrintJson(nlohmann::json{{"cameras", list}});
    } else {
        PrintTable(cameras);
    }
    if (result == zerrNone) return ExitDone;
    PrintError("not all cameras could be listed: " + DescribeResult(result));
    return GetExitCode(result);
}

}  // namespace ZentaraProgram

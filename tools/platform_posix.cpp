#include <dlfcn.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "platform.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

constexpr char ModuleName[] = "libzentara-simulation.so";

std::string GetLibraryFolder() {
    Dl_info info{};
    if (dladdr(reinterpret_cast<const void*>(&Zentara_LoadDriver), &info) == 0) return {};
    const std::string path = info.dli_fname != nullptr ? info.dli_fname : "";
    const std::size_t slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash);
}

}  // namespace

std::vector<std::string> GetArguments(int count, char** values) {
    return {values + (count > 0 ? 1 : 0), values + count};
}

std::FILE* TakeStandardOutput() {
    std::fflush(stdout);
    const int own = dup(STDOUT_FILENO);
    if (own < 0 || dup2(STDERR_FILENO, STDOUT_FILENO) < 0) return stdout;
    std::FILE* stream = fdopen(own, "w");
    return stream != nullptr ? stream : stdout;
}

void SetVariable(const char* name, const std::string& value) {
    (void)setenv(name, value.c_str(),
                 1);  // Fails only without memory; the scenario is then not found.
}

bool IsTerminal(std::FILE* stream) {
    return isatty(fileno(stream)) == 1;
}

std::FILE* OpenFile(const std::string& path, const char* mode) {
    return std::fopen(path.c_str(), mode);
}

bool IsDevice(const std::string& path) {
    struct stat facts = {};
    return stat(path.c_str(), &facts) == 0 && !S_ISREG(facts.st_mode) && !S_ISDIR(facts.st_mode);
}

std::error_code MakePrivateFolder(const std::string& path) {
    if (mkdir(path.c_str(), S_IRWXU) == 0) return {};
    return {errno, std::generic_category()};
}

std::string GetNarrowPath(const std::string& path) {
    return path;
}

bool CheckScenario(const std::string& scenario, std::string* message) {
    const std::string path = GetLibraryFolder() + "/" + ModuleName;
    void* module = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (module == nullptr) {
        *message = "there is no simulation beside the library (" + path + ")";
        return false;
    }
    using Check = std::uint32_t (*)(const char*, char*, std::uint32_t);
    const auto check = reinterpret_cast<Check>(dlsym(module, "ZentaraSimulation_CheckScenario"));
    char text[1024] = "the simulation does not fit this program";
    const bool isGood = check != nullptr && check(scenario.c_str(), text, sizeof text) == 0;
    if (!isGood) *message = text;
    return isGood;
}

}  // namespace ZentaraProgram

#include "tools/program.h"

#include <fstream>
#include <sstream>

#include "support/wait_until.h"

namespace ZentaraTest {
namespace {

ChildProcess Start(const std::vector<std::string>& commandLine,
                   const std::vector<std::string>& variables, const TemporaryFolder& folder) {
    return StartProcess(
        {commandLine, variables, folder.GetPath("output"), folder.GetPath("errors")});
}

ProgramResult Collect(ChildProcess process, const TemporaryFolder& folder,
                      std::chrono::seconds limit) {
    ProgramResult result;
    const bool isEnded =
        ZV::Test::WaitUntil([&] { return IsProcessEnded(process, &result.exitCode); }, limit);
    if (!isEnded) KillProcess(process);
    result.output = ReadFile(folder.GetPath("output"));
    result.errors = ReadFile(folder.GetPath("errors"));
    return result;
}

std::vector<std::string> MakeCommandLine(const std::vector<std::string>& arguments) {
    std::vector<std::string> commandLine{GetBuiltProgram("zentara")};
    commandLine.insert(commandLine.end(), arguments.begin(), arguments.end());
    return commandLine;
}

}  // namespace

RunningProgram::RunningProgram(const std::vector<std::string>& arguments,
                               const std::vector<std::string>& variables)
    : process(Start(MakeCommandLine(arguments), variables, folder)) {}

RunningProgram::~RunningProgram() {
    if (process != NoProcess) (void)Wait(std::chrono::seconds(0));
}

void RunningProgram::Interrupt() const {
    InterruptProcess(process);
}

void RunningProgram::Kill() {
    KillProcess(process);
    process = NoProcess;
}

ProgramResult RunningProgram::Wait(std::chrono::seconds limit) {
    ProgramResult result = Collect(process, folder, limit);
    process = NoProcess;
    return result;
}

ProgramResult RunProgram(const std::vector<std::string>& arguments,
                         const std::vector<std::string>& variables) {
    return RunningProgram(arguments, variables).Wait();
}

ProgramResult RunTool(const std::vector<std::string>& commandLine) {
    const TemporaryFolder folder;
    return Collect(Start(commandLine, {}, folder), folder, std::chrono::seconds(60));
}

std::string ReadFile(const std::string& path) {
    const std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

void WriteFile(const std::string& path, const std::string& text) {
    std::ofstream(path, std::ios::binary) << text;
}

}  // namespace ZentaraTest

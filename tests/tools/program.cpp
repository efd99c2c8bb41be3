#include "tools/program.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "support/wait_until.h"

namespace ZentaraTest {
namespace {

void Redirect(const std::string& path, int descriptor) {
    const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    if (file < 0 || dup2(file, descriptor) < 0) _exit(126);
}

int Start(const std::vector<std::string>& commandLine, const std::vector<std::string>& variables,
          const TemporaryFolder& folder) {
    const std::string output = folder.GetPath("output"), errors = folder.GetPath("errors");
    std::vector<char*> values;
    for (const std::string& value : commandLine) values.push_back(const_cast<char*>(value.c_str()));
    values.push_back(nullptr);
    const int process = fork();
    if (process != 0) return process;
    Redirect(output, STDOUT_FILENO);
    Redirect(errors, STDERR_FILENO);
    for (const std::string& variable : variables) putenv(const_cast<char*>(variable.c_str()));
    execvp(values[0], values.data());
    _exit(127);
}

ProgramResult Collect(int process, const TemporaryFolder& folder, std::chrono::seconds limit) {
    int status = 0;
    const bool isEnded =
        ZV::Test::WaitUntil([&] { return waitpid(process, &status, WNOHANG) == process; }, limit);
    if (!isEnded) {
        kill(process, SIGKILL);
        waitpid(process, &status, 0);
    }
    ProgramResult result;
    result.exitCode = isEnded && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    result.output = ReadFile(folder.GetPath("output"));
    result.errors = ReadFile(folder.GetPath("errors"));
    return result;
}

std::vector<std::string> MakeCommandLine(const std::vector<std::string>& arguments) {
    std::vector<std::string> commandLine{ZENTARA_BINARY_DIR "/bin/zentara"};
    commandLine.insert(commandLine.end(), arguments.begin(), arguments.end());
    return commandLine;
}

}  // namespace

RunningProgram::RunningProgram(const std::vector<std::string>& arguments,
                               const std::vector<std::string>& variables)
    : process(Start(MakeCommandLine(arguments), variables, folder)) {}

RunningProgram::~RunningProgram() {
    if (process > 0) (void)Wait(std::chrono::seconds(0));
}

void RunningProgram::Send(int signal) const {
    kill(process, signal);
}

ProgramResult RunningProgram::Wait(std::chrono::seconds limit) {
    ProgramResult result = Collect(process, folder, limit);
    process = -1;
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

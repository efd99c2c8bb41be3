#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>

#include "tools/child_process.h"

namespace ZentaraTest {
namespace {

void Redirect(const std::string& path, int descriptor) {
    const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    if (file < 0 || dup2(file, descriptor) < 0) _exit(126);
}

pid_t GetId(ChildProcess process) {
    return static_cast<pid_t>(process);
}

}  // namespace

ChildProcess StartProcess(const ProcessStart& start) {
    std::vector<char*> values;
    for (const std::string& value : start.commandLine)
        values.push_back(const_cast<char*>(value.c_str()));
    values.push_back(nullptr);
    const pid_t process = fork();
    if (process != 0) return process;
    Redirect(start.output, STDOUT_FILENO);
    Redirect(start.errors, STDERR_FILENO);
    for (const std::string& variable : start.variables) putenv(const_cast<char*>(variable.c_str()));
    execvp(values[0], values.data());
    _exit(127);
}

void InterruptProcess(ChildProcess process) {
    if (process == NoProcess) return;
    kill(GetId(process), SIGINT);
}

bool IsProcessEnded(ChildProcess process, int* exitCode) {
    int status = 0;
    *exitCode = -1;
    if (process == NoProcess) return true;
    if (waitpid(GetId(process), &status, WNOHANG) != GetId(process)) return false;
    if (WIFEXITED(status)) *exitCode = WEXITSTATUS(status);
    return true;
}

void KillProcess(ChildProcess process) {
    if (process == NoProcess) return;
    kill(GetId(process), SIGKILL);
    waitpid(GetId(process), nullptr, 0);
}

std::string GetBuiltProgram(const std::string& name) {
    return ZENTARA_BINARY_DIR "/bin/" + name;
}

}  // namespace ZentaraTest

#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>
#include <string>

#include "commands.h"
#include "interrupt.h"
#include "output.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

struct Arguments {
    CommonOptions common;
    GrabOptions grab;
    StreamOptions stream;
};

/// Options that may stand before or behind the name of the command.
void AddCommon(CLI::App* command, CommonOptions* common) {
    command->add_option("--simulation", common->simulation,
                        "Simulated cameras: a built-in scenario, model:NAME, or a JSON file");
    command->add_flag("--json", common->asJson, "Results as JSON");
}

void AddCamera(CLI::App* command, CommonOptions* common) {
    AddCommon(command, common);
    command->add_option("camera", common->camera, "Number of the camera in the list")
        ->default_val(0);
}

void AddGrab(CLI::App& app, Arguments* arguments) {
    CLI::App* grab = app.add_subcommand("grab", "Take one image and write it to a file");
    AddCamera(grab, &arguments->common);
    grab->add_option("-o,--output", arguments->grab.output, "File: .fits, .tiff, .png or .raw")
        ->required();
    grab->add_option("--timeout", arguments->grab.timeoutSeconds,
                     "Longest wait for the image, seconds")
        ->default_val(60)
        ->check(CLI::Range(0.001, 1e6));
}

void AddStream(CLI::App& app, Arguments* arguments) {
    StreamOptions* options = &arguments->stream;
    CLI::App* stream = app.add_subcommand("stream", "Take images one after the other");
    AddCamera(stream, &arguments->common);
    stream->add_option("-n,--count", options->count, "Number of frames")
        ->check(CLI::PositiveNumber);
    stream->add_option("-d,--duration", options->durationSeconds, "Length, seconds")
        ->check(CLI::PositiveNumber);
    stream->add_option("-o,--output", options->output,
                       "Numbered files: night.fits gives night-000001.fits ...");
    stream->add_option("--timeout", options->timeoutSeconds, "Longest wait for a frame, seconds")
        ->default_val(60)
        ->check(CLI::Range(0.001, 1e6));
    stream->add_option("--buffers", options->buffers, "Frames queued at once")
        ->default_val(8)
        ->check(CLI::Range(1, 100));
    stream->add_flag("-q,--quiet", options->isQuiet, "No progress");
}

ExitCode RunCommand(const CLI::App& app, const Arguments& arguments) {
    if (!arguments.common.simulation.empty()) {
        std::string message;
        if (!CheckScenario(arguments.common.simulation, &message)) {
            PrintError("the simulation is refused: " + message);
            return ExitWrongUse;
        }
        SetVariable("ZENTARA_SIMULATION", arguments.common.simulation);
    }
    if (app.got_subcommand("list")) return RunList(arguments.common);
    if (app.got_subcommand("info")) return RunInfo(arguments.common);
    if (app.got_subcommand("grab")) return RunGrab(arguments.common, arguments.grab);
    return RunStream(arguments.common, arguments.stream);
}

ExitCode Run(int count, char** values) {
    Arguments arguments;
    CLI::App app{"Cameras on the command line"};
    app.name("zentara");
    app.footer(
        "Exit codes: 0 done, 1 camera or capture failed, 2 wrong use, 3 no such camera, 4 camera "
        "busy,\n"
        "5 camera gone, 6 finished with lost or damaged frames, 130 interrupted.");
    app.require_subcommand(1);
    AddCommon(&app, &arguments.common);
    AddCommon(app.add_subcommand("list", "List the cameras that nobody else holds"),
              &arguments.common);
    AddCamera(app.add_subcommand("info", "Tell what a camera is and can do"), &arguments.common);
    AddGrab(app, &arguments);
    AddStream(app, &arguments);
    try {
        app.parse(count, values);
    } catch (const CLI::Success& success) {
        Print(app.help());
        (void)success;
        return ExitDone;
    } catch (const CLI::ParseError& error) {
        PrintError(error.what());
        PrintError("`zentara --help` tells how it is used");
        return ExitWrongUse;
    }
    return RunCommand(app, arguments);
}

}  // namespace
}  // namespace ZentaraProgram

int main(int count, char** values) {
    using namespace ZentaraProgram;
    SetOutput(TakeStandardOutput());
    CatchInterrupt();
    try {
        const ExitCode code = Run(count, values);
        if (FlushOutput()) return code;
        PrintError("the result cannot be written to standard output");
        return code == ExitDone ? ExitFailed : code;
    } catch (const std::exception& failure) {
        PrintError(failure.what());
        return ExitFailed;
    }
}

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <exception>
#include <string>
#include <utility>
#include <vector>

#include "commands.h"
#include "interrupt.h"
#include "output.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

constexpr const char* SettingsNote =
    "Values carry their units (exposure=250ms, gain-db=3.5, cooling=-10C) or names "
    "(image-format=mono16,\n"
    "trigger-type=software, cooler-active=on). `zentara limits` shows what a camera allows.";
constexpr const char* SetNote =
    "A camera is set up anew whenever cameras are listed, by this program too: what is set lasts "
    "until\n"
    "then. For images with other settings use `zentara grab --set` or `zentara stream --set`.";
constexpr const char* PreflightNote =
    "Shows what a send would make of the settings, and sends nothing. But a camera in real-time "
    "video\n"
    "leaves that mode and enters it again to be asked for the limits of the standard mode: that\n"
    "stops a stream.";

constexpr const char* ProcessNote =
    "The library finishes frames by the camera behind them, so a camera has to be there: that of "
    "--camera.\n"
    "Its model and its sensor decide, whatever camera took the frame; a note tells when the models "
    "differ.\n"
    "A frame of a simulated camera is processed with --simulation. The gains are those of the "
    "frame, "
    "unless\n"
    "--load or --set gives others; what else is set does not matter.";
constexpr const char* MeasureNote =
    "The camera takes images of its own for it. What was measured lasts until cameras are listed "
    "again;\n"
    "give it to `zentara grab` and `zentara stream` with --set, or let `zentara grab "
    "--white-balance`\n"
    "measure itself.";

struct Arguments {
    CommonOptions common;
    GrabOptions grab;
    StreamOptions stream;
    HistogramOptions histogram;
    ProcessOptions process;
    MeasureCommandOptions measure;
    SettingsOptions settings;
    std::string file;
    std::vector<std::string> words;  ///< Keys or assignments, with the camera's number before them.
};

/// Options that may stand before or behind the name of the command.
void AddCommon(CLI::App* command, CommonOptions* common) {
    command->add_option("--simulation", common->simulation,
                        "Simulated cameras: a built-in scenario, model:NAME, or a JSON file");
    command->add_flag("--json", common->asJson, "Results as JSON");
}

void AddCamera(CLI::App* command, CommonOptions* common) {
    AddCommon(command, common);
    command->add_option("camera,--camera", common->camera, "Number of the camera in the list")
        ->default_val(0);
}

/// The camera's number may stand before words that are none.
void AddWords(CLI::App* command, Arguments* arguments, const char* name, const char* meaning) {
    AddCommon(command, &arguments->common);
    command->add_option("--camera", arguments->common.camera, "Number of the camera in the list")
        ->default_val(0);
    command->add_option(name, arguments->words, meaning);
}

void AddSettings(CLI::App* command, SettingsOptions* settings) {
    command->add_option("--load", settings->file, "File of settings to send first");
    command->add_option("--set", settings->assignments, "KEY=VALUE, as often as needed")
        ->allow_extra_args(false);
}

constexpr const char* FormatMeaning =
    "Format of the images: rgb24, rgb48, bgr24, rgb-planes, bayer8, mono16 ...";
constexpr const char* FinishedFormatMeaning =
    "Format of the image of a mosaic: of 8 bits rgb24 (else), bgr24, xrgb32 or bgrx32; of more "
    "rgb48";

void AddFormat(CLI::App* command, ColourOptions* colour, const char* meaning) {
    command->add_option("--format", colour->format, meaning);
    command->add_option("--bayer", colour->algorithm,
                        "How a mosaic becomes colours: average, fast or bicubic");
}

void AddColour(CLI::App* command, ColourOptions* colour) {
    command->add_flag("--colour,--color", colour->isColour,
                      "Three colours, made and balanced by post-processing");
    AddFormat(command, colour, FormatMeaning);
}

/// The ranges of numbers let through what is no number.
std::string FindNoNumber(std::string& text) {
    double number = 0;
    const bool isNumber = CLI::detail::lexical_cast(text, number) && std::isfinite(number);
    return isNumber ? std::string{} : fmt::format("'{}' is no number", text);
}

void AddTimeout(CLI::App* command, double* seconds, const char* meaning) {
    command->add_option("--timeout", *seconds, meaning)
        ->default_val(60)
        ->check(CLI::Range(0.001, 1e6))
        ->check(CLI::Validator(FindNoNumber, ""));
}

void AddRegion(CLI::App* command, std::string* region) {
    command->add_option("--region", *region,
                        "Where to measure: X,Y,WxH in pixels of the image; else all of it");
}

void AddQuestions(CLI::App& app, Arguments* arguments) {
    constexpr const char* Words = "Number of the camera, then names; without names all";
    AddWords(app.add_subcommand("info", "Tell what a camera is and can do"), arguments, "keys",
             Words);
    AddWords(app.add_subcommand("get", "Show the settings in force"), arguments, "keys", Words);
    AddWords(app.add_subcommand("limits", "Show what a camera allows for its settings"), arguments,
             "keys", Words);
}

void AddSet(CLI::App& app, Arguments* arguments) {
    CLI::App* set = app.add_subcommand("set", "Send settings and show what they changed");
    AddWords(set, arguments, "assignments", "Number of the camera, then KEY=VALUE ...");
    set->get_option("assignments")->required();
    set->footer(fmt::format("{}\n\n{}", SettingsNote, SetNote));
    CLI::App* preflight =
        app.add_subcommand("preflight", "Show what settings would change, and change nothing");
    AddCamera(preflight, &arguments->common);
    AddSettings(preflight, &arguments->settings);
    preflight->footer(fmt::format("{}\n\n{}", PreflightNote, SettingsNote));
}

void AddSettingsFiles(CLI::App& app, Arguments* arguments) {
    CLI::App* settings = app.add_subcommand("settings", "Keep settings in files");
    AddCommon(settings, &arguments->common);
    settings->require_subcommand(1);
    CLI::App* save = settings->add_subcommand("save", "Write the settings in force to a file");
    CLI::App* load = settings->add_subcommand("load", "Send the settings of a file");
    for (CLI::App* command : {save, load}) {
        command->add_option("file", arguments->file, "File of settings, JSON")->required();
        AddCamera(command, &arguments->common);
    }
    AddSettings(save, &arguments->settings);
    load->footer(SetNote);
}

void AddGrab(CLI::App& app, Arguments* arguments) {
    CLI::App* grab = app.add_subcommand("grab", "Take one image and write it to a file");
    AddCamera(grab, &arguments->common);
    grab->add_option("-o,--output", arguments->grab.output, "File: .fits, .tiff, .png or .raw")
        ->required();
    AddTimeout(grab, &arguments->grab.timeoutSeconds, "Longest wait for the image, seconds");
    AddColour(grab, &arguments->grab.settings.colour);
    grab->add_flag("--white-balance", arguments->grab.isBalanced,
                   "Measure the white balance first");
    AddRegion(grab, &arguments->grab.measure.region);
    AddSettings(grab, &arguments->grab.settings);
    grab->footer(SettingsNote);
}

void AddStream(CLI::App& app, Arguments* arguments) {
    StreamOptions* options = &arguments->stream;
    CLI::App* stream = app.add_subcommand("stream", "Take images one after the other");
    AddCamera(stream, &arguments->common);
    stream->add_option("-n,--count", options->count, "Number of frames")
        ->check(CLI::PositiveNumber);
    stream->add_option("-d,--duration", options->durationSeconds, "Length, seconds")
        ->check(CLI::PositiveNumber)
        ->check(CLI::Validator(FindNoNumber, ""));
    stream->add_option("-o,--output", options->output,
                       "Numbered files: night.fits gives night-000001.fits ...");
    AddTimeout(stream, &options->timeoutSeconds, "Longest wait for a frame, seconds");
    stream->add_option("--buffers", options->buffers, "Frames queued at once")
        ->default_val(8)
        ->check(CLI::Range(1, 100));
    stream->add_flag("-q,--quiet", options->isQuiet, "No progress");
    AddColour(stream, &options->settings.colour);
    AddSettings(stream, &options->settings);
    stream->footer(SettingsNote);
}

void AddMeasurements(CLI::App& app, Arguments* arguments) {
    CLI::App* balance =
        app.add_subcommand("white-balance", "Measure which gains make the mean of a region grey");
    CLI::App* exposure = app.add_subcommand(
        "auto-expose", "Find the exposure that brings a region just below full scale");
    MeasureCommandOptions* options = &arguments->measure;
    for (CLI::App* command : {balance, exposure}) {
        AddCamera(command, &arguments->common);
        AddRegion(command, &options->measure.region);
        AddTimeout(command, &options->measure.timeoutSeconds, "Longest time for it, seconds");
        AddSettings(command, &options->settings);
        command->footer(MeasureNote);
    }
}

void AddProcess(CLI::App& app, Arguments* arguments) {
    ProcessOptions* options = &arguments->process;
    CLI::App* process =
        app.add_subcommand("process", "Make a finished image of a frame that was stored raw");
    AddCommon(process, &arguments->common);
    process->add_option("file", options->file, "FITS file of grab or stream")->required();
    process->add_option("-o,--output", options->output, "File: .fits, .tiff, .png or .raw")
        ->required();
    process->add_option("--camera", arguments->common.camera, "Number of the camera in the list")
        ->default_val(0);
    AddFormat(process, &options->settings.colour, FinishedFormatMeaning);
    AddSettings(process, &options->settings);
    process->footer(ProcessNote);
}

void AddHistogram(CLI::App& app, Arguments* arguments) {
    HistogramOptions* options = &arguments->histogram;
    CLI::App* histogram =
        app.add_subcommand("histogram", "Show how often each value stands in an image");
    AddCommon(histogram, &arguments->common);
    histogram
        ->add_option("source", options->source, "Number of a camera, or a FITS, TIFF or PNG file")
        ->default_val("0");
    histogram->add_option("--png", options->picture, "Draw it into a file as well");
    AddTimeout(histogram, &options->timeoutSeconds, "Longest wait for the image, seconds");
    AddColour(histogram, &options->settings.colour);
    AddSettings(histogram, &options->settings);
    histogram->footer("The bars are logarithmic: a bin of one sample still shows.");
}

bool IsNumber(const std::string& text) {
    return !text.empty() &&
           std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

/// Takes the camera's number out of the words. False when it is too large for one.
bool TakeCamera(Arguments* arguments) {
    std::vector<std::string>& words = arguments->words;
    if (words.empty() || !IsNumber(words.front())) return true;
    const std::string& text = words.front();
    const auto [end, problem] =
        std::from_chars(text.data(), text.data() + text.size(), arguments->common.camera);
    if (problem != std::errc{}) return false;
    words.erase(words.begin());
    return true;
}

ExitCode RunSetOfWords(const Arguments& arguments) {
    if (!arguments.words.empty()) return RunSet(arguments.common, {{}, arguments.words, {}, {}});
    PrintError("there is nothing to set; KEY=VALUE is wanted");
    return ExitWrongUse;
}

/// A command and what runs it, by the names on the command line.
struct CommandRow {
    std::vector<const char*> names;
    ExitCode (*run)(const Arguments&);
};

const std::vector<CommandRow>& GetCommands() {
    static const std::vector<CommandRow> commands{
        {{"list"}, [](const Arguments& a) { return RunList(a.common); }},
        {{"info"}, [](const Arguments& a) { return RunInfo(a.common, a.words); }},
        {{"get"}, [](const Arguments& a) { return RunGet(a.common, a.words); }},
        {{"limits"}, [](const Arguments& a) { return RunLimits(a.common, a.words); }},
        {{"set"}, RunSetOfWords},
        {{"preflight"}, [](const Arguments& a) { return RunPreflight(a.common, a.settings); }},
        {{"settings", "save"},
         [](const Arguments& a) { return RunSave(a.common, a.file, a.settings); }},
        {{"settings", "load"},
         [](const Arguments& a) {
             return RunSet(a.common, {a.file, {}, {}, {}});
         }},
        {{"grab"}, [](const Arguments& a) { return RunGrab(a.common, a.grab); }},
        {{"white-balance"},
         [](const Arguments& a) {
             return RunMeasure(a.common, Measurement::WhiteBalance, a.measure);
         }},
        {{"auto-expose"},
         [](const Arguments& a) { return RunMeasure(a.common, Measurement::Exposure, a.measure); }},
        {{"process"}, [](const Arguments& a) { return RunProcess(a.common, a.process); }},
        {{"histogram"}, [](const Arguments& a) { return RunHistogram(a.common, a.histogram); }},
        {{"stream"}, [](const Arguments& a) { return RunStream(a.common, a.stream); }},
    };
    return commands;
}

bool IsChosen(const CLI::App& app, const CommandRow& command) {
    const CLI::App* place = &app;
    for (const char* name : command.names) {
        if (!place->got_subcommand(name)) return false;
        place = place->get_subcommand(name);
    }
    return true;
}

ExitCode RunCommand(const CLI::App& app, Arguments arguments) {
    if (!arguments.common.simulation.empty()) {
        std::string message;
        if (!CheckScenario(arguments.common.simulation, &message)) {
            PrintError("the simulation is refused: " + message);
            return ExitWrongUse;
        }
        SetVariable("ZENTARA_SIMULATION", arguments.common.simulation);
    }
    if (!TakeCamera(&arguments)) {
        PrintError(fmt::format("there is no camera {}", arguments.words.front()));
        return ExitNoCamera;
    }
    for (const CommandRow& command : GetCommands()) {
        if (IsChosen(app, command)) return command.run(arguments);
    }
    return ExitWrongUse;
}

ExitCode Run(std::vector<std::string> words) {
    Arguments arguments;
    CLI::App app{"Cameras on the command line"};
    app.name("zentara");
    app.footer(
        "Exit codes: 0 done, 1 camera, capture or a file failed, 2 wrong use, 3 no such camera, "
        "4 camera\n"
        "busy, 5 camera gone, 6 finished with lost or damaged frames, 130 interrupted.");
    app.require_subcommand(1);
    AddCommon(&app, &arguments.common);
    AddCommon(app.add_subcommand("list", "List the cameras that nobody else holds"),
              &arguments.common);
    AddQuestions(app, &arguments);
    AddSet(app, &arguments);
    AddSettingsFiles(app, &arguments);
    AddGrab(app, &arguments);
    AddStream(app, &arguments);
    AddMeasurements(app, &arguments);
    AddProcess(app, &arguments);
    AddHistogram(app, &arguments);
    try {
        std::reverse(words.begin(), words.end());  // The parser takes the last one first.
        app.parse(std::move(words));
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
        const ExitCode code = Run(GetArguments(count, values));
        if (FlushOutput()) return code;
        PrintError("the result cannot be written to standard output");
        return code == ExitDone ? ExitFailed : code;
    } catch (const std::exception& failure) {
        PrintError(failure.what());
        return ExitFailed;
    }
}

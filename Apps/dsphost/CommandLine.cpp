#include "CommandLine.h"

#include <algorithm>
#include <functional>
#include <memory>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include <CLI/CLI.hpp>

#include "Arguments.h"
#include "AudioReader.h"
#include "Errors.h"
#include "Process.h"
#include "ShellFiles.h"
#include "Text.h"

// Every command and its options. The parser's header takes seconds to compile: no other file includes it.
namespace dsphost {
namespace {

// Types of values that shells complete; so are words with | between them.
constexpr const char *kFile = "FILE", *kEffect = "EFFECT";

// The command, and the record that its options fill and `run` gets.
template <typename Arguments>
std::pair<CLI::App&, Arguments&> Add(CLI::App& app, const char* name, const char* what,
                                     void (*run)(Arguments)) {
    const auto arguments = std::make_shared<Arguments>();
    auto* const command = app.add_subcommand(name, what);
    command->callback([arguments, run] { run(std::move(*arguments)); });
    return {*command, *arguments};
}

void AddInput(CLI::App& command, ReadingOptions& reading) {
    command.add_option("IN", reading.input, "Audio file, or - for standard input")
        ->required()
        ->type_name(kFile);
    command
        .add_option_function<std::string>(
            "--spool-limit",
            [&reading](const std::string& size) { reading.spoolLimit = ParseSpoolLimit(size); },
            "Most that a temporary file may take for input that does not stream (8G)")
        ->type_name("BYTES");
}

void AddAudioOutput(CLI::App& command, std::string& output) {
    command.add_option("OUT", output, "Audio file by its ending, or - for WAV on standard output")
        ->required()
        ->type_name(kFile);
}

void AddFormat(CLI::App& command, std::string& format) {
    command.add_option("--format", format, "Of the samples; the input's when left out")
        ->type_name("s16|s24|f32|f64");
}

void AddWriting(CLI::App& command, WritingOptions& writing) {
    command.add_flag("-y", writing.rules.overwrite, "Overwrite an existing output");
    command.add_flag("-q", writing.quiet, "No progress");
}

void AddPicture(CLI::App& command, PictureOptions& o) {
    command.add_option("--size", o.size, "Of the picture, in pixels (1280x720)")->type_name("WIDTHxHEIGHT");
    command.add_option("--dpi", o.dpi, "Dots per inch that texts and lines are sized for (96)");
    command.add_option("--font", o.font, "The typeface, where Montserrat is not installed")->type_name(kFile);
}

void AddDrawing(CLI::App& command, PictureOptions& o) {
    AddPicture(command, o);
    command.add_option("--scale", o.scale, "Frequency scale")->type_name("log|linear");
    command.add_option("--view", o.view, "Display options, separated by commas")
        ->type_name(Joined(ViewNames(), "|"))
        ->delimiter(',');
}

void AddConvert(CLI::App& app) {
    const auto [command, a] =
        Add(app, "convert", "Converts an audio file to another sample rate or format", RunConvert);
    AddInput(command, a);
    AddAudioOutput(command, a.output);
    command.add_option("--rate", a.rate, "Sample rate in Hz")->required();
    AddFormat(command, a.format);
    command.add_option("--dither", a.dither, "For s16 and s24")->type_name("none|tpdf|shaped|shaped-strong");
    command.add_flag("--exact", a.exact, "By the exact ratio of the rates, whatever its factors");
    AddWriting(command, a.writing);
}

void AddDenoise(CLI::App& app) {
    const auto [command, a] = Add(
        app, "denoise", "Takes steady noise out of a recording, aligned and as long as it was", RunDenoise);
    AddInput(command, a);
    AddAudioOutput(command, a.output);
    command.add_option("--learn", a.learn, "Seconds that hold noise only; as often as there are")
        ->type_name("FROM:TO")
        ->allow_extra_args(false);
    command.add_option("--profile", a.profile, "File of noise learned before")->type_name(kFile);
    command.add_option("--save-profile", a.saveProfile, "Writes what was learned")->type_name(kFile);
    command.add_option("--set", a.settings, "\"label=value, ...\", as of the effect Denoiser")
        ->type_name("SETTINGS");
    command.add_option("--residue", a.residue, "Audio file of what was taken away")->type_name(kFile);
    AddFormat(command, a.format);
    AddWriting(command, a.writing);
}

void AddEffects(CLI::App& app) {
    const auto [command, a] =
        Add(app, "effects", "Lists the effects, or one effect's parameters and presets", RunEffects);
    command.add_option("NAME", a.effect, "One effect")->type_name(kEffect);
    command.add_flag("--json", a.json, "As JSON");
}

void AddPitch(CLI::App& app) {
    const auto [command, a] =
        Add(app, "pitch", "Transposes an audio file, aligned and as long as it was", RunPitch);
    AddInput(command, a);
    AddAudioOutput(command, a.output);
    command.add_option("--semitones", a.semitones, "How far, -36 to 36")->required();
    command.add_option("--engine", a.engine, "new when left out")->type_name("new|classic");
    command.add_option("--quality", a.quality, "new: 0 to 9; classic: 0 to 13; default 4");
    command.add_option("--speed", a.speed, "new only: playback speed, 0.1 to 10; moves the pitch along");
    AddFormat(command, a.format);
    AddWriting(command, a.writing);
}

void AddEqCurve(CLI::App& app) {
    const auto [command, a] =
        Add(app, "eq-curve", "Writes the frequency response of the equaliser", RunEqCurve);
    command.add_option("OUT", a.output, "CSV file, or - for standard output")->required()->type_name(kFile);
    command.add_option("--fx", a.effect, "\"EQ: FREQ TYPE [GAIN_DB] [q=Q]; ...\"")
        ->type_name("BANDS")
        ->required()
        ->allow_extra_args(false);
    command.add_option("--rate", a.rate, "Sample rate in Hz");
    command.add_flag("--json", a.json, "As JSON");
    AddWriting(command, a.writing);
}

void AddRender(CLI::App& app) {
    const auto [command, a] =
        Add(app, "render", "Renders an audio file through a chain of effects", RunRender);
    AddInput(command, a);
    AddAudioOutput(command, a.output);
    command
        .add_option("--fx", a.effects,
                    "\"NAME: label=value, ...\"; once per effect, in the order of processing")
        ->type_name(kEffect)
        ->allow_extra_args(false);
    command.add_option("--automation", a.automation, "JSON file of parameter moves")->type_name(kFile);
    command.add_option("--save-chunk", a.chunks, "Writes the effect's settings; once per --fx")
        ->type_name(kFile)
        ->allow_extra_args(false);
    AddFormat(command, a.format);
    command.add_option("--tail", a.tail, "So long after the input's end, or auto: until it has died away")
        ->type_name("SECONDS");
    command.add_option("--precision", a.options.precision, "Bits of the samples in the chain, 32 or 64");
    command.add_option("--block", a.options.block, "Most frames per block");
    command.add_flag("--planar", a.options.planar, "One buffer per channel, where an effect supports it");
    AddWriting(command, a.writing);
}

void AddSonogram(CLI::App& app) {
    const auto [command, a] =
        Add(app, "sonogram", "Draws how the spectrum of an audio file changes", RunSonogram);
    AddInput(command, a);
    command.add_option("OUT", a.output, "PNG picture")->required()->type_name(kFile);
    command.add_option("--scheme", a.scheme, "Colours, 0 to 6");
    command.add_option(
        "--speed", a.speed,
        "0 to 8: 5, 10, 15, 30, 60, 90, 150, 300 or 450 columns a second; the picture then ends "
        "with the file. Without it the whole file is in the picture where it fits");
    command.add_flag("--spectrum", a.spectrum, "With the last spectrum above");
    command.add_flag("--pitch", a.pitch, "With the pitch that the tuner hears");
    AddDrawing(command, a.drawing);
    AddWriting(command, a.writing);
}

void AddSpectrum(CLI::App& app) {
    const auto [command, a] =
        Add(app, "spectrum", "Writes the mean spectrum of an audio file, its channels mixed", RunSpectrum);
    AddInput(command, a);
    command.add_option("OUT", a.picture, "PNG picture: the mean, and the highest levels as a thin line")
        ->type_name(kFile);
    command.add_option("--csv", a.csv, "Table of frequencies and mean levels, 0 dB a full-scale sine")
        ->type_name(kFile);
    command.add_option("--length", a.length, "Samples per transform, a power of two from 128 to 524288");
    command.add_option("--window", a.window, "Shape of the windows")
        ->type_name("rectangular|triangular|hann|hamming|blackman");
    command.add_option("--overlap", a.overlap, "Share of a window that the next one repeats, 0 to 0.99");
    command
        .add_option("--profile", a.profile,
                    "File of noise learned by denoise, to be drawn under the mean; a column of the table")
        ->type_name(kFile);
    AddDrawing(command, a.drawing);
    AddWriting(command, a.writing);
}

void AddTuner(CLI::App& app) {
    const auto [command, a] =
        Add(app, "tuner", "Names the notes of an audio file and draws the tuner", RunTuner);
    AddInput(command, a);
    command.add_option("OUT", a.output, "PNG picture of the panel while the longest note sounds")
        ->required()
        ->type_name(kFile);
    command.add_flag("--json", a.json, "What was heard 30 times a second, on standard output");
    command.add_option("--at", a.at, "The moment to draw instead")->type_name("SECONDS");
    command.add_option("--method", a.method, "Of detection")->type_name(Joined(DetectionMethods(), "|"));
    command.add_option("--temperament", a.temperament, "Equal, Pythagorean, Vallotti, ...")
        ->type_name("NAME");
    command.add_option("--sensitivity", a.sensitivity, "Standard, Noisy environment, Sensitive, ...")
        ->type_name("NAME");
    AddDrawing(command, a.drawing);
    AddWriting(command, a.writing);
}

void AddTuneVoice(CLI::App& app) {
    const auto [command, a] =
        Add(app, "tune-voice", "Corrects the pitch of a voice, aligned and as long as it was", RunTuneVoice);
    AddInput(command, a);
    AddAudioOutput(command, a.output);
    command.add_option("--scale", a.scale, "Root and mode, such as \"A minor\"; chromatic when left out")
        ->type_name("SCALE");
    command.add_option("--retune", a.retune, "Time that the correction takes, 0 to 400 (20)")
        ->type_name("MILLISECONDS");
    command.add_option("--transition", a.transition, "Time from note to note, 0 to 500 (40)")
        ->type_name("MILLISECONDS");
    command.add_option("--ratio", a.ratio, "Share of the error taken away, 0 to 100 (100)")
        ->type_name("PERCENT");
    command.add_option("--lowest", a.lowest, "The lowest pitch sung, 55, 75, 110 or 160 (75)")
        ->type_name("HERTZ");
    command.add_option("--notes", a.notes, "The notes decided, as .csv or .mid")->type_name(kFile);
    command.add_option("--curve", a.curve, "PNG picture: the pitch heard and corrected over the notes")
        ->type_name(kFile);
    AddFormat(command, a.format);
    AddPicture(command, a.drawing);
    AddWriting(command, a.writing);
}

// The tables above, for the manual and the shells.
ShellOption Described(const CLI::Option& option) {
    ShellOption described{option.get_name(true),
                          option.get_description(),
                          option.get_type_name(),
                          {},
                          option.get_positional(),
                          option.get_required(),
                          option.get_items_expected_max() > 1};
    if (option.get_items_expected_max() == 0) described.type.clear();
    if (described.isPlace) return described;
    for (const auto& name : option.get_snames()) described.names.push_back("-" + name);
    for (const auto& name : option.get_lnames()) described.names.push_back("--" + name);
    return described;
}

std::vector<ShellCommand> Described(const CLI::App& app) {
    std::vector<ShellCommand> commands;
    for (const auto* command : app.get_subcommands({})) {
        commands.push_back({command->get_name(), command->get_description(), {}});
        auto& options = commands.back().options;
        for (const auto* option : command->get_options()) options.push_back(Described(*option));
        std::stable_partition(options.begin(), options.end(),
                              [](const ShellOption& each) { return each.isPlace; });
    }
    return commands;
}

// Told here, because the parser would only say that a command is missing.
void CheckCommand(const CLI::App& app, int count, char** arguments) {
    std::vector<std::string> names;
    for (const auto* command : app.get_subcommands({})) names.push_back(command->get_name());
    if (count < 2) throw UserError("a command is missing; " + Suggestion("", names));
    const std::string name = arguments[1];
    if (!name.starts_with('-') && std::ranges::find(names, name) == names.end())
        throw UserError("there is no command \"" + name + "\"; " + Suggestion(name, names));
}

// The parser's "Could not convert: --rate = 1e5" in our own words.
std::string NotANumber(const CLI::App& app, const std::string& text) {
    const auto colon = text.find(": "), equals = text.find(" = ");
    if (colon == text.npos || equals == text.npos) return text + "; see --help";
    const std::string name = text.substr(colon + 2, equals - colon - 2);
    const auto* const option = app.get_subcommands().front()->get_option_no_throw(name);
    return name + " cannot be \"" + Shortened(text.substr(equals + 3), kLongestQuote) + "\"; accepted: a " +
           (option && option->get_type_name() == "INT" ? "whole number in plain digits" : "number");
}

}  // namespace

void RunCommandLine(int count, char** arguments) {
    CLI::App app("Renders and examines audio files with the effects of DSPDll.", "dsphost");
    app.require_subcommand(1);
    app.set_version_flag("--version", DSPHOST_VERSION);
    // In the order in which help lists them.
    for (const auto add : {AddConvert, AddDenoise, AddEffects, AddPitch, AddEqCurve, AddRender, AddSonogram,
                           AddSpectrum, AddTuner, AddTuneVoice})
        add(app);
    if (count == 3 && arguments[1] == std::string_view("--write-for"))
        return Print(WriteFor(arguments[2], Described(app)));
    CheckCommand(app, count, arguments);
    try {
        app.parse(count, arguments);
    } catch (const CLI::Success& help) {  // --help, --version
        std::ostringstream text, none;
        app.exit(help, text, none);
        Print(text.str());
    } catch (const CLI::ConversionError& error) {
        throw UserError(NotANumber(app, error.what()));
    } catch (const CLI::ParseError& error) {
        throw UserError(std::string(error.what()) + "; see --help");
    }
}

}  // namespace dsphost

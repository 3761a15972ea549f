#include <algorithm>
#include <exception>
#include <string>
#include <vector>

#include "Commands.h"
#include "Errors.h"
#include "File.h"
#include "Text.h"

namespace dsphost {
namespace {

// One line registers a command.
constexpr void (*kCommands[])(CLI::App&) = {
    AddConvertCommand, AddEffectsCommand,  AddPitchCommand,    AddEqCurveCommand,
    AddRenderCommand,  AddSonogramCommand, AddSpectrumCommand, AddTunerCommand,
};

constexpr int kSuccess = 0, kIoFailure = 1, kUserFailure = 2, kInterrupted = 130;

// Told here, because the parser would only say that a command is missing.
void CheckCommand(const CLI::App& app, int count, char** arguments) {
    std::vector<std::string> names;
    for (const auto* command : app.get_subcommands({})) names.push_back(command->get_name());
    if (count < 2) throw UserError("a command is missing; " + Suggestion("", names));
    const std::string name = arguments[1];
    if (!name.starts_with('-') && std::ranges::find(names, name) == names.end())
        throw UserError("there is no command \"" + name + "\"; " + Suggestion(name, names));
}

int Run(int count, char** arguments) {
    CLI::App app("Renders and examines audio files with the effects of DSPDll.", "dsphost");
    app.require_subcommand(1);
    app.set_version_flag("--version", DSPHOST_VERSION);
    for (const auto add : kCommands) add(app);
    try {
        CheckCommand(app, count, arguments);
        app.parse(count, arguments);
        return kSuccess;
    } catch (const CLI::Success& help) {  // --help, --version
        return app.exit(help);
    } catch (const CLI::ParseError& error) {
        PrintMessage(std::string(error.what()) + "; see --help");
    } catch (const UserError& error) {
        PrintMessage(error.what());
    } catch (const Interrupted& error) {
        PrintMessage(error.what());
        return kInterrupted;
    } catch (const std::exception& error) {
        PrintMessage(error.what());
        return kIoFailure;
    }
    return kUserFailure;
}

}  // namespace

void WritingOptions::AddTo(CLI::App& command) {
    command.add_flag("-y", rules.overwrite, "Overwrite an existing output");
    command.add_flag("-q", quiet, "No progress");
}

}  // namespace dsphost

int main(int count, char** arguments) {
    dsphost::PrepareProcess();
    return dsphost::Run(count, arguments);
}

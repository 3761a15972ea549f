#include <exception>

#include "Commands.h"
#include "Errors.h"
#include "File.h"

namespace dsphost {
namespace {

// One line registers a command.
constexpr void (*kCommands[])(CLI::App&) = {
    AddEffectsCommand,
    AddRenderCommand,
};

constexpr int kSuccess = 0, kIoFailure = 1, kUserFailure = 2, kInterrupted = 130;

int Run(int count, char** arguments) {
    CLI::App app("Renders and examines audio files with the effects of DSPDll.", "dsphost");
    app.require_subcommand(1);
    app.set_version_flag("--version", DSPHOST_VERSION);
    for (const auto add : kCommands) add(app);
    try {
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

#include <charconv>
#include <cstdio>
#include <exception>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

#include <SDL.h>
#include <CLI/CLI.hpp>

#include "Program.h"
#include "ShellFiles.h"

namespace analyser {
namespace {

std::optional<std::pair<int, int>> ReadSize(const std::string& text) {
    const char* const end = text.data() + text.size();
    int width = 0, height = 0;
    const auto [x, first] = std::from_chars(text.data(), end, width);
    if (first != std::errc() || x == end || *x != 'x') return std::nullopt;
    const auto [last, second] = std::from_chars(x + 1, end, height);
    const bool fits = second == std::errc() && last == end && width >= 64 && height >= 48 && width <= 16384 &&
                      height <= 16384;
    return fits ? std::optional(std::pair(width, height)) : std::nullopt;
}

// In the order in which help lists them.
void AddOptions(CLI::App& app, Options& options) {
    app.set_version_flag("--version", DSPANALYSER_VERSION);
    app.add_option("FILE", options.file, "Plays this file instead of listening")->type_name("");
    app.add_flag("--no-audio", options.noAudio, "Uses no sound devices; a file is shown silently");
    app.add_option("--input", options.input, "The name of the input to listen to")->type_name("NAME");
    app.add_flag("--full-screen", options.fullScreen, "Fills the screen");
    const auto size = [&options](const std::string& text) {
        const auto read = ReadSize(text);
        if (!read) throw CLI::ValidationError("--size", "must be WIDTHxHEIGHT, from 64x48 to 16384x16384");
        std::tie(options.width, options.height) = *read;
    };
    app.add_option_function<std::string>("--size", size, "The window's size in pixels")
        ->type_name("WIDTHxHEIGHT");
    app.add_option("--dpi", options.dpi, "The screen's dots per inch; 96 is plain, 192 twice as fine")
        ->check(CLI::Range(24.0f, 960.0f).description(""))
        ->type_name("N");
    app.add_option("--save-to", options.saveTo, "The folder for pictures and numbers")->type_name("FOLDER");
}

std::vector<ShellOption> Described(const CLI::App& app) {
    std::vector<ShellOption> described;
    for (const auto* option : app.get_options())
        described.push_back({option->get_name(),
                             option->get_items_expected_max() > 0 ? option->get_type_name() : "",
                             option->get_description()});
    return described;
}

int Show(const Options& options) {
    SDL_SetHint(SDL_HINT_VIDEO_ALLOW_SCREENSAVER, "1");
#ifdef SDL_HINT_AUDIO_INCLUDE_MONITORS
    SDL_SetHint(SDL_HINT_AUDIO_INCLUDE_MONITORS, "1");  // what the computer plays is an input, too
#endif
    if (SDL_Init(SDL_INIT_VIDEO) != 0) {
        std::fprintf(stderr, "dspdll-analyser: no window can be opened: %s\n", SDL_GetError());
        return 1;
    }
    // Pictures go straight to the screen there, without a detour over a graphics library.
    if (SDL_strcmp(SDL_GetCurrentVideoDriver(), "x11") == 0)
        SDL_SetHint(SDL_HINT_FRAMEBUFFER_ACCELERATION, "0");
    int status = 0;
    try {
        Program(options).Run();
    } catch (const std::exception& problem) {
        std::fprintf(stderr, "dspdll-analyser: %s\n", problem.what());
        status = 1;
    }
    SDL_Quit();
    return status;
}

}  // namespace
}  // namespace analyser

int main(int argc, char** argv) {
    CLI::App app(
        "Shows the spectrum, the sonogram and the note of what a sound input hears, or of an audio file.");
    analyser::Options options;
    analyser::AddOptions(app, options);
    if (argc == 3 && argv[1] == std::string_view("--write-for")) {
        const std::string text = analyser::WriteFor(argv[2], analyser::Described(app));
        std::fputs(text.c_str(), stdout);
        return text.empty() ? 2 : 0;
    }
    CLI11_PARSE(app, argc, argv);
    return analyser::Show(options);
}

#include <charconv>
#include <cstdio>
#include <exception>
#include <optional>
#include <string>
#include <tuple>
#include <utility>

#include <SDL.h>
#include <CLI/CLI.hpp>

#include "Program.h"

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

}  // namespace

int main(int argc, char** argv) {
    analyser::Options options;
    CLI::App app(
        "Shows the spectrum, the sonogram and the note of what a sound input hears, or of an audio file.");
    std::string size;
    app.set_version_flag("--version", DSPANALYSER_VERSION);
    app.add_option("FILE", options.file, "Plays this file instead of listening");
    app.add_flag("--no-audio", options.noAudio, "Uses no sound devices; a file is shown silently");
    app.add_option("--input", options.input, "The name of the input to listen to");
    app.add_flag("--full-screen", options.fullScreen, "Fills the screen");
    app.add_option("--size", size, "The window's WIDTHxHEIGHT")->check([](const std::string& text) {
        return ReadSize(text) ? std::string()
                              : std::string("must be WIDTHxHEIGHT, from 64x48 to 16384x16384");
    });
    app.add_option("--dpi", options.dpi, "The screen's dots per inch; 96 is plain, 192 twice as fine")
        ->check(CLI::Range(24.0f, 960.0f));
    app.add_option("--save-to", options.saveTo, "The folder for pictures and numbers");
    CLI11_PARSE(app, argc, argv);
    if (const auto read = ReadSize(size)) std::tie(options.width, options.height) = *read;

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
        analyser::Program(options).Run();
    } catch (const std::exception& problem) {
        std::fprintf(stderr, "dspdll-analyser: %s\n", problem.what());
        status = 1;
    }
    SDL_Quit();
    return status;
}

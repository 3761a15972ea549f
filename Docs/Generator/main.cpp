#include <algorithm>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <stdexcept>

#include "EffectPage.h"
#include "EqualiserPage.h"
#include "RoomsDiagram.h"

namespace {

void Write(const std::filesystem::path& path, const std::string& text) {
    std::ofstream file(path, std::ios::binary);
    file << text;
    if (!file.flush()) throw std::runtime_error(path.string() + " cannot be written");
}

// A row that links to a page, of its title and its first paragraph.
std::string Row(const std::string& file, const std::string& page) {
    const auto end = page.find('\n'), begin = page.find_first_not_of('\n', end);
    std::string paragraph = page.substr(begin, page.find("\n\n", begin) - begin);
    std::ranges::replace(paragraph, '\n', ' ');
    return "| [" + page.substr(2, end - 2) + "](" + file + ") | " + paragraph + " |\n";
}

}  // namespace

// dsp_pages SOURCE TARGET: the pages made from the library, from the project's folder into another one.
int main(int count, char** arguments) try {
    if (count != 3) throw std::invalid_argument("usage: dsp_pages SOURCE TARGET");
    const std::filesystem::path source = arguments[1], target = arguments[2];
    std::filesystem::create_directories(target / "effects");
    std::string rows, list;
    const auto write = [&](const std::string& file, const auto& page) {
        const auto text = source / "Docs" / "Effects" / file;
        try {
            const std::string written = page(text.string());
            Write(target / "effects" / file, written);
            rows += Row(file, written);
        } catch (const std::exception& error) {
            throw std::runtime_error(text.string() + ": " + error.what());
        }
        list += file + '\n';
    };
    for (const auto& kind : Corvo::DSP::EffectKinds())
        write(docs::FileName(kind.name) + ".md",
              [&](const std::string& text) { return docs::EffectPage(kind, text); });
    write("equaliser.md", docs::EqualiserPage);
    Write(target / "effects" / "index.md", "# Effects\n\n| Effect | Good for |\n| --- | --- |\n" + rows +
                                               "\n```{toctree}\n:hidden:\n" + list + "```\n");
    Write(target / "rooms.html", docs::DrawRooms((source / "README.md").string()));
    return 0;
} catch (const std::exception& error) {
    std::cerr << error.what() << '\n';
    return 1;
}

#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Picture.h"

class kivspectrum;

namespace dsphost {

class OutputFile;
struct OutputRules;

// What every command that draws takes.
struct PictureOptions {
    std::string size, font, scale;  // of no size: 1280x720
    std::vector<std::string> view;
    float dpi = 96.0f;

    // An empty picture. Throws UserError for a size or resolution that cannot be.
    // `narrower` takes pixels from the width where the user chose none.
    std::unique_ptr<Picture> Make(int narrower = 0) const;
    // Chooses the analyser's display options, as its menu does. Throws UserError for an unknown one.
    void ApplyTo(kivspectrum& analyser) const;
};

// What a display option may be.
std::vector<std::string> ViewNames();

// Throws UserError for a name that promises something else than a PNG file.
std::unique_ptr<OutputFile> OpenPicture(const std::string& path, const OutputRules& rules);
void Write(Picture& picture, OutputFile& output);
// Writes and commits.
void Save(Picture& picture, OutputFile& output);

}  // namespace dsphost

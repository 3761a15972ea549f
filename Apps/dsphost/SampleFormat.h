#pragma once

#include <optional>
#include <string>

#include <sndfile.h>

namespace dsphost {

// How an audio file stores its samples. Vorbis is what an Ogg file holds.
enum class SampleFormat { S8, S16, S24, S32, F32, F64, Vorbis };

std::string Name(SampleFormat format);  // "s16"
// 0 for floats and Vorbis.
int IntegerBits(SampleFormat format);
// s16, s24, f32 or f64; throws UserError for anything else.
SampleFormat ParseSampleFormat(const std::string& name);

// What the samples of a libsndfile subtype are: companded and ADPCM ones decode to 16 bits. Nothing for
// lossy codecs, which have no sample format of their own.
std::optional<SampleFormat> FromSubtype(int subtype);

// libsndfile's major format for an output, by the ending of its name; WAV for streams (standard output,
// devices, pipes). Throws UserError listing the endings.
int ContainerFor(const std::string& path, bool stream);
// libsndfile's subtype of `format` in `container`; nothing when that container cannot hold it.
std::optional<int> SubtypeIn(int container, SampleFormat format);

// The sample format of an output: the one asked for, else the input's own, else (lossy input) f32, s24 where
// floats do not go. Throws UserError when the container cannot hold it.
SampleFormat ChooseSampleFormat(const std::string& path, int container, std::optional<SampleFormat> input,
                                std::optional<SampleFormat> asked);
// Throws UserError unless files of this kind hold so many channels at such a rate.
void RequireShape(const std::string& path, int container, int channels, int rate);

}  // namespace dsphost

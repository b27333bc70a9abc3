#pragma once
// Ogg Vorbis files made from 16-bit PCM, and the tones to fill them with. The content tool,
// the tests and the demo make all their sounds with these, so no sound file is kept that
// the program cannot make again.
#include <cstddef>
#include <cstdint>
#include <vector>

namespace ox::sound {

// Interleaved 16-bit samples of a sine tone of `frequency` Hz at `amplitude` (0 to 1 of
// full scale), the same in every channel, with `fade` milliseconds of fade-in and fade-out
// so that a loop or a stop does not click.
std::vector<int16_t> SynthesiseTone(double frequency, size_t frames, int channels, int rate, double amplitude,
                                    double fade = 0.0);

struct VorbisEncodeOptions {
    float quality = 0.4f;       // -0.1 to 1
    int serial = 1;             // the logical stream's serial number
    bool endOfStream = true;    // false: the last page loses its end-of-stream flag
};

// Encodes `frames` frames of interleaved PCM and appends the Ogg file to `out`. False, with a
// log line on channel "sound", when the encoder refuses the channel count or the rate.
bool EncodeVorbis(const int16_t* pcm, size_t frames, int channels, int rate, std::vector<uint8_t>& out,
                  const VorbisEncodeOptions& options = {});

} // namespace ox::sound

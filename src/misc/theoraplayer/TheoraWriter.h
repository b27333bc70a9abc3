#pragma once
// Ogg Theora files made from generated frames, with an optional Vorbis track. The content
// tool, the tests, the benchmark and the demo make all their videos with these, so no video
// is kept that the program cannot make again.
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

struct TheoraEncodeOptions {
    enum Layout {
        Colour,   // the frames' colour; their alpha is dropped
        Alpha,    // the frames' alpha as grey: the alpha track of a translucent video
        Stacked,  // colour above, alpha as grey below: a picture twice as high
    };
    unsigned fpsNumerator = 25, fpsDenominator = 1;
    int quality = 48;  // 0 to 63
    Layout layout = Colour;
    int serial = 0x0E0;
    // A Vorbis track of interleaved 16-bit samples, none without.
    const int16_t* pcm = nullptr;
    size_t pcmFrames = 0;
    int channels = 1;
    int rate = 22050;
    float audioQuality = 0.2f;
};

// Fills `pixels` (width x height 0xAARRGGBB words, top-down) with frame `index`.
using TheoraFrameSource = std::function<void(unsigned index, std::vector<uint32_t>& pixels)>;

// Encodes `frames` frames and appends the Ogg file to `out`. False, with a log line on
// channel "video", when an encoder refuses the sizes, the rate or the channels.
bool EncodeTheora(unsigned width, unsigned height, unsigned frames, const TheoraFrameSource& source,
                  std::vector<uint8_t>& out, const TheoraEncodeOptions& options = {});

// Generated frames, the same every time. Patterns:
//   levels: the whole frame one grey level that rises with the index, alpha the same
//           level (a test tells the frames, and their alpha, apart by it);
//   bars:   colour bands that drift with the index and a white bar that crosses the frame;
//   disc:   a disc whose colour turns and whose size pulses, opaque on a transparent ground
//           with a soft edge.
bool MakeVideoFrame(const std::string& pattern, unsigned width, unsigned height, unsigned index, unsigned count,
                    std::vector<uint32_t>& pixels);
const char* VideoPatternNames();
// The grey level of frame `index` of `count` in the levels pattern.
uint8_t VideoLevel(unsigned index, unsigned count);

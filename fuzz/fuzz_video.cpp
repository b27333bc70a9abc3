// Feeds arbitrary bytes to both video decoders: the main-thread track (open, decode and
// convert to the end, rewind) and a clip of the threaded library (load, decode every frame
// into its queue, taking them as the clock runs), on an exact-size copy. The first byte
// picks the form: odd, the input is the whole file; even, the input's blocks overwrite a
// small generated video at offsets they give, so that changes reach the decoders past the
// headers without a seed corpus.
#include "graphics/VideoTrack.h"
#include "misc/theoraplayer/TheoraPlayer.h"
#include "misc/theoraplayer/TheoraWriter.h"

#include <cstdint>
#include <cstring>
#include <vector>

namespace {

volatile uint32_t g_Sink;

const std::vector<uint8_t>& Base()
{
    static const std::vector<uint8_t> bytes = [] {
        std::vector<uint8_t> out;
        EncodeTheora(34, 18, 6, [](unsigned i, std::vector<uint32_t>& pixels) {
            MakeVideoFrame("disc", 34, 18, i, 6, pixels);
        }, out);
        return out;
    }();
    return bytes;
}

std::vector<uint8_t> MakeFile(const uint8_t* data, size_t size)
{
    if (size == 0 || (data[0] & 1))
        return std::vector<uint8_t>(data, data + size);
    std::vector<uint8_t> file = Base();
    // Blocks: a 16-bit offset, a length byte, then that many bytes.
    for (size_t i = 1; i + 3 <= size;) {
        const size_t at = (data[i] | data[i + 1] << 8) % file.size(), n = data[i + 2];
        i += 3;
        for (size_t k = 0; k < n && i < size; ++k, ++i)
            file[(at + k) % file.size()] = data[i];
    }
    return file;
}

void MainThread(const std::vector<uint8_t>& file)
{
    ox::graphics::CVideoTrack track;
    if (!track.OpenMemory(file.data(), file.size(), "fuzz.ogv"))
        return;
    std::vector<uint32_t> pixels(static_cast<size_t>(track.Width()) * track.Height());
    th_ycbcr_buffer planes;
    for (int pass = 0; pass < 2; ++pass) {
        for (int i = 0; i < 512; ++i) {
            const auto result = track.DecodeNext();
            if (result == ox::graphics::CVideoTrack::kEnd)
                break;
            if (result == ox::graphics::CVideoTrack::kFrame && track.Planes(planes))
                TheoraYuvToRgb(planes, track.Picture(), pixels.data(), track.Width(), kAlphaKeep);
        }
        g_Sink = g_Sink + track.FrameTime() + (pixels.empty() ? 0 : pixels.back());
        track.Rewind();
    }
}

void Threaded(const std::vector<uint8_t>& file)
{
    TheoraVideoClip clip(new TheoraMemoryFileDataSource(file.data(), file.size(), "fuzz.ogv"), 2, 4, false);
    try {
        clip.load(nullptr);
    } catch (const _TheoraGenericException&) {
        return;
    }
    for (int i = 0; i < 512 && !clip.isDone(); ++i) {
        clip.decodeNextFrame();
        clip.update(0.04f);
        while (TheoraVideoFrame* frame = clip.getNextFrame()) {
            g_Sink = g_Sink + frame->getBuffer()[0];
            clip.popFrame();
        }
        if (i == 20)
            clip.seek(0.0f), clip.doSeek();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::vector<uint8_t> file = MakeFile(data, size);  // exactly sized
    MainThread(file);
    Threaded(file);
    return 0;
}

// oxmedia: image, sound and video content for the game. Generates test images, Ogg Vorbis
// tones and Ogg Theora videos, converts images to the PVR containers, builds the alpha-mask table, and describes
// media files, all with the code the game reads them with.
#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "common/LogToStderr.h"
#include "diag/Log.h"
#include "graphics/VideoTrack.h"
#include "misc/theoraplayer/TheoraWriter.h"
#include "misc/sys/Path.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/MediaWriter.h"
#include "misc/imagelib/PvrContainer.h"
#include "sound/OggVorbisStream.h"
#include "sound/VorbisWriter.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

namespace fs = std::filesystem;
using namespace ox::misc::imagelib;

namespace {

const char* kUsage =
    "usage: oxmedia png <out.png> [options]                 write a test pattern as PNG\n"
    "       oxmedia jpeg <out.jpg> [options]                write a test pattern as JPEG\n"
    "       oxmedia pvr <image> <out.pvr|out.pvrlzo> [--format NAME]\n"
    "                                                       convert a PNG or JPEG to a container\n"
    "       oxmedia alpha <out.bindump> [--order O] [ID=]IMAGE...\n"
    "                                                       build the alpha-mask table\n"
    "       oxmedia ogg <out.ogg> [options]                 write tones as Ogg Vorbis\n"
    "       oxmedia ogv <out.ogv> [options]                 write generated frames as Ogg Theora\n"
    "       oxmedia info FILE...                            describe images, containers, tables, sounds, videos\n"
    "       oxmedia COMMAND --help                          details of one command\n";

const char* kPngHelp =
    "usage: oxmedia png <out.png> [--size WxH] [--pattern NAME] [--layout L] [--depth N] [--interlace]\n"
    "\n"
    "Writes a generated image. --size defaults to 64x64, --pattern to checker.\n"
    "Patterns: checker, gradient, circle (opaque disc on transparent), stripes\n"
    "(transparent and opaque columns), noise (random channels, the same every time),\n"
    "spinner (a sprite sheet: square cells side by side, a dot turning round a ring).\n"
    "Layouts: rgba (default), rgb, palette (with a transparency table; up to 256\n"
    "colours, 1 to 8 bits as needed), grey, greyalpha. --depth: 8 (default) or 16;\n"
    "grey also takes 1, 2 or 4. --interlace writes Adam7 interlacing.\n";

const char* kJpegHelp =
    "usage: oxmedia jpeg <out.jpg> [--size WxH] [--pattern NAME] [--quality Q] [--grey] [--progressive]\n"
    "\n"
    "Writes a generated image as JPEG (RGB, or one grey channel with --grey); alpha is\n"
    "dropped. --quality 0 to 100, default 90. Sizes and patterns as for png.\n";

const char* kPvrHelp =
    "usage: oxmedia pvr <image.png|image.jpg> <out.pvr|out.pvrlzo> [--format NAME]\n"
    "\n"
    "Converts an image to the PVR texture container; an output name ending in .pvrlzo\n"
    "gets the LZO-compressed form. Formats (default argb8888):\n";

const char* kAlphaHelp =
    "usage: oxmedia alpha <out.bindump> [--order auto|rows|columns] [ID=]IMAGE...\n"
    "\n"
    "Builds properties/texturesalpha.bindump: one run-length mask per image, a pixel\n"
    "being solid when its alpha is not 0. The id is the texture id the game asks with;\n"
    "without ID= it is the image's file name without folder and extension. Images of\n"
    "one answer everywhere take no runs. --order picks the scan order; auto (default)\n"
    "takes whichever gives fewer runs.\n";

const char* kOggHelp =
    "usage: oxmedia ogg <out.ogg> [--tone HZ[:SECONDS][,HZ[:SECONDS]...]] [--seconds S] [--rate R]\n"
    "                   [--channels 1|2] [--amplitude A] [--quality Q] [--no-end]\n"
    "\n"
    "Writes Ogg Vorbis: sine tones one after another, each faded in and out over 5 ms so\n"
    "that nothing clicks (a frequency of 0 is a rest). --tone defaults to 440; --seconds,\n"
    "the length of a tone that gives none, to 1; --rate to 44100; --channels to 2;\n"
    "--amplitude (of full scale) to 0.5; --quality (-0.1 to 1) to 0.4. --no-end leaves the\n"
    "last page without its end-of-stream flag, as a cut file has it.\n";

const char* kOgvHelp =
    "usage: oxmedia ogv <out.ogv> [--size WxH] [--frames N] [--fps F] [--pattern NAME] [--layout L]\n"
    "                   [--quality Q] [--tone HZ[:SECONDS][,...]] [--rate R] [--channels 1|2]\n"
    "\n"
    "Writes an Ogg Theora video of generated frames, the same bytes every time. --size\n"
    "defaults to 64x48, --frames to 25, --fps to 25, --pattern to levels (also bars, disc),\n"
    "--quality (0 to 63) to 48. Layouts: colour (default); alpha, the frames' alpha as grey\n"
    "(the alpha track of a translucent video); stacked, colour above and alpha below in a\n"
    "picture twice as high. --tone adds a Vorbis track of sine tones as for ogg (rate\n"
    "default 22050, one channel).\n";

const char* kInfoHelp =
    "usage: oxmedia info FILE...\n"
    "\n"
    "Prints the size of PNG and JPEG images, the size and surface format of .pvr and\n"
    ".pvrlzo containers, the masks of an alpha-mask table, and the rate, channels and\n"
    "length of an Ogg Vorbis file, and the picture size and duration of an Ogg Theora video.\n";

int UsageError(const std::string& message, const char* usage = kUsage)
{
    fprintf(stderr, "oxmedia: %s\n%s", message.c_str(), usage);
    return 2;
}

bool Write(const std::string& path, const std::vector<uint8_t>& bytes)
{
    if (ox::misc::sys::WriteFileAtomically(path, bytes.data(), bytes.size()))
        return true;
    fprintf(stderr, "oxmedia: cannot write %s\n", path.c_str());
    return false;
}

bool Decode(const std::string& path, Image& image)
{
    std::string error;
    if (DecodeImageOnDisk(path, image, error))
        return true;
    fprintf(stderr, "oxmedia: %s\n", error.c_str());
    return false;
}

// Options shared by the generators: --size WxH and --pattern NAME.
struct Generated {
    uint32_t width = 64, height = 64;
    std::string pattern = "checker";
};

// Reads "--name value" pairs into `take`; true when every argument was used.
template <class Take>
bool Options(int argc, char** argv, int first, std::vector<std::string>& positional, Take take, std::string& error)
{
    for (int i = first; i < argc; ++i) {
        std::string arg = argv[i];
        if (arg.rfind("--", 0) != 0) {
            positional.push_back(arg);
            continue;
        }
        const char* value = i + 1 < argc ? argv[i + 1] : nullptr;
        int used = take(arg, value);
        if (used < 0) {
            error = "bad option " + arg + (value && used == -2 ? std::string(" ") + value : "");
            return false;
        }
        i += used;
    }
    return true;
}

int TakeGenerated(Generated& g, const std::string& arg, const char* value)
{
    if (arg == "--size") {
        unsigned w = 0, h = 0;
        char tail = 0;
        if (!value || sscanf(value, "%ux%u%c", &w, &h, &tail) != 2 || w == 0 || h == 0 || w > 16384 || h > 16384)
            return -2;
        g.width = w;
        g.height = h;
        return 1;
    }
    if (arg == "--pattern") {
        if (!value)
            return -1;
        g.pattern = value;
        return 1;
    }
    return -1;
}

bool WantsHelp(int argc, char** argv)
{
    for (int i = 2; i < argc; ++i)
        if (strcmp(argv[i], "--help") == 0 || strcmp(argv[i], "-h") == 0)
            return true;
    return false;
}

bool MakePixels(const Generated& g, std::vector<uint32_t>& pixels)
{
    if (MakePattern(g.pattern, g.width, g.height, pixels))
        return true;
    fprintf(stderr, "oxmedia: unknown pattern %s (known: %s)\n", g.pattern.c_str(), PatternNames());
    return false;
}

int Png(int argc, char** argv)
{
    Generated g;
    PngOptions options;
    std::vector<std::string> files;
    std::string error;
    bool ok = Options(argc, argv, 2, files, [&](const std::string& arg, const char* value) {
        if (arg == "--interlace") {
            options.interlaced = true;
            return 0;
        }
        if (arg == "--depth") {
            options.bit_depth = value ? atoi(value) : 0;
            return options.bit_depth > 0 ? 1 : -2;
        }
        if (arg == "--layout") {
            const std::string v = value ? value : "";
            if (v == "rgba") options.layout = PngLayout::Rgba;
            else if (v == "rgb") options.layout = PngLayout::Rgb;
            else if (v == "palette") options.layout = PngLayout::Palette;
            else if (v == "grey") options.layout = PngLayout::Grey;
            else if (v == "greyalpha") options.layout = PngLayout::GreyAlpha;
            else return -2;
            return 1;
        }
        return TakeGenerated(g, arg, value);
    }, error);
    if (!ok)
        return UsageError(error, kPngHelp);
    if (files.size() != 1)
        return UsageError("png needs one output file", kPngHelp);
    std::vector<uint32_t> pixels;
    if (!MakePixels(g, pixels))
        return 1;
    std::vector<uint8_t> png;
    if (!EncodePng(pixels.data(), g.width, g.height, png, options))
        return 1;
    return Write(files[0], png) ? 0 : 1;
}

int Jpeg(int argc, char** argv)
{
    Generated g;
    int quality = 90;
    bool grey = false, progressive = false;
    std::vector<std::string> files;
    std::string error;
    bool ok = Options(argc, argv, 2, files, [&](const std::string& arg, const char* value) {
        if (arg == "--grey" || arg == "--progressive") {
            (arg == "--grey" ? grey : progressive) = true;
            return 0;
        }
        if (arg == "--quality") {
            char* end = nullptr;
            long q = value ? strtol(value, &end, 10) : -1;
            if (!value || *end || q < 0 || q > 100)
                return -2;
            quality = int(q);
            return 1;
        }
        return TakeGenerated(g, arg, value);
    }, error);
    if (!ok)
        return UsageError(error, kJpegHelp);
    if (files.size() != 1)
        return UsageError("jpeg needs one output file", kJpegHelp);
    std::vector<uint32_t> pixels;
    if (!MakePixels(g, pixels))
        return 1;
    std::vector<uint8_t> jpeg;
    if (!EncodeJpeg(pixels.data(), g.width, g.height, quality, jpeg, grey, progressive))
        return 1;
    return Write(files[0], jpeg) ? 0 : 1;
}

bool EndsWith(const std::string& text, const char* tail)
{
    size_t n = strlen(tail);
    return text.size() >= n && text.compare(text.size() - n, n, tail) == 0;
}

int Pvr(int argc, char** argv)
{
    std::string help = std::string(kPvrHelp) + PvrFormatNames();
    int format = PvrARGB8888;
    std::vector<std::string> files;
    std::string error;
    bool ok = Options(argc, argv, 2, files, [&](const std::string& arg, const char* value) {
        if (arg != "--format")
            return -1;
        format = value ? PvrFormatByName(value) : -1;
        return format >= 0 ? 1 : -2;
    }, error);
    if (!ok)
        return UsageError(error, help.c_str());
    if (files.size() != 2)
        return UsageError("pvr needs an image and an output file", help.c_str());
    Image image;
    if (!Decode(files[0], image))
        return 1;
    std::vector<uint8_t> pvr;
    if (!EncodePvr(image.pixels.data(), image.width, image.height, unsigned(format), pvr))
        return 1;
    if (EndsWith(files[1], ".pvrlzo")) {
        std::vector<uint8_t> packed;
        if (!CompressPvrLzo(pvr.data(), pvr.size(), packed)) {
            fprintf(stderr, "oxmedia: LZO compression failed\n");
            return 1;
        }
        pvr.swap(packed);
    }
    return Write(files[1], pvr) ? 0 : 1;
}

int Alpha(int argc, char** argv)
{
    int order = 0;
    std::vector<std::string> args;
    std::string error;
    bool ok = Options(argc, argv, 2, args, [&](const std::string& arg, const char* value) {
        if (arg != "--order" || !value)
            return -1;
        order = ox::core::AlphaMaskOrder(value);
        return order >= 0 ? 1 : -2;
    }, error);
    if (!ok)
        return UsageError(error, kAlphaHelp);
    if (args.size() < 2)
        return UsageError("alpha needs an output file and at least one image", kAlphaHelp);
    std::vector<ox::core::AlphaMaskFile> images;
    for (size_t i = 1; i < args.size(); ++i) {
        const size_t equals = args[i].find('=');
        if (equals != std::string::npos)
            images.push_back({args[i].substr(0, equals), args[i].substr(equals + 1)});
        else
            images.push_back({fs::path(args[i]).stem().string(), args[i]});
    }
    size_t size = 0;
    if (!ox::core::WriteTexturesAlpha(images, order, args[0], error, &size)) {
        fprintf(stderr, "oxmedia: %s\n", error.c_str());
        return 1;
    }
    printf("%s: %zu masks, %zu bytes\n", args[0].c_str(), images.size(), size);
    return 0;
}

struct Tone {
    double frequency;
    double seconds;
};

// "HZ[:SECONDS],..." into tones; false for anything else.
bool ParseTones(const std::string& text, double seconds, int rate, std::vector<Tone>& tones)
{
    std::istringstream list(text);
    for (std::string item; std::getline(list, item, ',');) {
        char* end = nullptr;
        Tone tone {strtod(item.c_str(), &end), seconds};
        if (*end == ':')
            tone.seconds = strtod(end + 1, &end);
        if (*end || !(tone.frequency >= 0 && tone.frequency < rate / 2.0) || !(tone.seconds > 0 && tone.seconds <= 600))
            return false;
        tones.push_back(tone);
    }
    return !tones.empty();
}

int Ogg(int argc, char** argv)
{
    std::string toneList = "440";
    double seconds = 1.0, amplitude = 0.5;
    int rate = 44100, channels = 2;
    ox::sound::VorbisEncodeOptions options;
    std::vector<std::string> files;
    std::string error;
    bool ok = Options(argc, argv, 2, files, [&](const std::string& arg, const char* value) {
        if (arg == "--no-end") {
            options.endOfStream = false;
            return 0;
        }
        if (!value)
            return -1;
        if (arg == "--tone")
            toneList = value;
        else if (arg == "--seconds")
            seconds = atof(value);
        else if (arg == "--rate")
            rate = atoi(value);
        else if (arg == "--channels")
            channels = atoi(value);
        else if (arg == "--amplitude")
            amplitude = atof(value);
        else if (arg == "--quality")
            options.quality = static_cast<float>(atof(value));
        else
            return -1;
        return 1;
    }, error);
    if (!ok)
        return UsageError(error, kOggHelp);
    if (files.size() != 1)
        return UsageError("ogg needs one output file", kOggHelp);
    std::vector<Tone> tones;
    if (rate < 8000 || rate > 192000 || channels < 1 || channels > 2 || !(amplitude >= 0 && amplitude <= 1) ||
        !(options.quality >= -0.1f && options.quality <= 1.0f) || !ParseTones(toneList, seconds, rate, tones))
        return UsageError("bad tone, rate, channels, amplitude or quality", kOggHelp);
    std::vector<int16_t> pcm;
    for (const Tone& tone : tones) {
        const auto frames = static_cast<size_t>(tone.seconds * rate + 0.5);
        std::vector<int16_t> part = ox::sound::SynthesiseTone(tone.frequency, frames, channels, rate, amplitude, 5.0);
        pcm.insert(pcm.end(), part.begin(), part.end());
    }
    std::vector<uint8_t> bytes;
    if (!ox::sound::EncodeVorbis(pcm.data(), pcm.size() / channels, channels, rate, bytes, options))
        return 1;
    if (!Write(files[0], bytes))
        return 1;
    printf("%s: %zu frames, %d Hz, %d channel(s), %zu bytes\n", files[0].c_str(), pcm.size() / channels, rate,
           channels, bytes.size());
    return 0;
}

int Ogv(int argc, char** argv)
{
    Generated g;
    g.width = 64, g.height = 48, g.pattern = "levels";
    unsigned frames = 25;
    TheoraEncodeOptions options;
    std::string toneList;
    std::vector<std::string> files;
    std::string error;
    bool ok = Options(argc, argv, 2, files, [&](const std::string& arg, const char* value) {
        if (arg == "--size" || arg == "--pattern")
            return TakeGenerated(g, arg, value);
        if (!value)
            return -1;
        const int number = atoi(value);
        if (arg == "--frames" && number > 0)
            frames = static_cast<unsigned>(number);
        else if (arg == "--fps" && number > 0)
            options.fpsNumerator = static_cast<unsigned>(number);
        else if (arg == "--quality" && number >= 0 && number <= 63)
            options.quality = number;
        else if (arg == "--tone")
            toneList = value;
        else if (arg == "--rate" && number >= 8000 && number <= 192000)
            options.rate = number;
        else if (arg == "--channels" && (number == 1 || number == 2))
            options.channels = number;
        else if (arg == "--layout" && strcmp(value, "colour") == 0)
            options.layout = TheoraEncodeOptions::Colour;
        else if (arg == "--layout" && strcmp(value, "alpha") == 0)
            options.layout = TheoraEncodeOptions::Alpha;
        else if (arg == "--layout" && strcmp(value, "stacked") == 0)
            options.layout = TheoraEncodeOptions::Stacked;
        else
            return -2;
        return 1;
    }, error);
    if (!ok)
        return UsageError(error, kOgvHelp);
    if (files.size() != 1)
        return UsageError("ogv needs one output file", kOgvHelp);
    std::vector<uint32_t> probe;
    if (!MakeVideoFrame(g.pattern, 1, 1, 0, 1, probe)) {
        fprintf(stderr, "oxmedia: unknown video pattern %s (known: %s)\n", g.pattern.c_str(), VideoPatternNames());
        return 2;
    }
    std::vector<int16_t> pcm;
    if (!toneList.empty()) {
        std::vector<Tone> tones;
        if (!ParseTones(toneList, static_cast<double>(frames) * options.fpsDenominator / options.fpsNumerator,
                        options.rate, tones))
            return UsageError("bad tone", kOgvHelp);
        for (const Tone& tone : tones) {
            const auto count = static_cast<size_t>(tone.seconds * options.rate + 0.5);
            std::vector<int16_t> part =
                ox::sound::SynthesiseTone(tone.frequency, count, options.channels, options.rate, 0.5, 5.0);
            pcm.insert(pcm.end(), part.begin(), part.end());
        }
        options.pcm = pcm.data();
        options.pcmFrames = pcm.size() / options.channels;
    }
    std::vector<uint8_t> bytes;
    const auto source = [&](unsigned index, std::vector<uint32_t>& pixels) {
        MakeVideoFrame(g.pattern, g.width, g.height, index, frames, pixels);
    };
    if (!EncodeTheora(g.width, g.height, frames, source, bytes, options) || !Write(files[0], bytes))
        return 1;
    printf("%s: %ux%u, %u frames at %u fps%s, %zu bytes\n", files[0].c_str(), g.width, g.height, frames,
           options.fpsNumerator, pcm.empty() ? "" : " with sound", bytes.size());
    return 0;
}

int Info(int argc, char** argv)
{
    if (argc < 3)
        return UsageError("info needs a file", kInfoHelp);
    int status = 0;
    for (int i = 2; i < argc; ++i) {
        std::string path = argv[i];
        std::string data;
        if (!ox::misc::sys::ReadWholeFile(path, data)) {
            fprintf(stderr, "oxmedia: cannot read %s\n", path.c_str());
            status = 1;
            continue;
        }
        bool ok = false;
        if (std::unique_ptr<CImageDecoder> decoder = MakeDecoder(path.c_str())) {
            decoder->SetName(path);
            uint32_t w = 0, h = 0;
            if ((ok = decoder->GetInfo(data.data(), data.size(), w, h)))
                printf("%s: %ux%u\n", path.c_str(), w, h);
        } else if (EndsWith(path, ".pvr") || EndsWith(path, ".pvrlzo")) {
            auto show = [&](const void* bytes, size_t size) {
                PvrTexture t;
                if (!PvrParse(bytes, size, path.c_str(), t))
                    return false;
                printf("%s: %ux%u, surface format %u, %zu bytes of texture\n", path.c_str(), t.width, t.height,
                       t.internal_format, t.size);
                return true;
            };
            ok = EndsWith(path, ".pvrlzo") ? PvrDecompressLzo(data.data(), data.size(), path.c_str(), show)
                                           : show(data.data(), data.size());
        } else if (EndsWith(path, ".ogg")) {
            ox::sound::COggVorbisStream stream;
            if ((ok = stream.OpenMemory(data.data(), static_cast<unsigned>(data.size()), path.c_str())))
                printf("%s: Ogg Vorbis, %d Hz, %s, %.3f s\n", path.c_str(), stream.GetRate(),
                       stream.IsStereo() ? "stereo" : "mono", stream.GetLength());
        } else if (EndsWith(path, ".ogv")) {
            ox::graphics::CVideoTrack track;
            if ((ok = track.OpenMemory(data.data(), data.size(), path.c_str())))
                printf("%s: Ogg Theora, %ux%u, %u ms\n", path.c_str(), track.Width(), track.Height(),
                       track.Duration());
        } else if (EndsWith(path, ".bindump")) {
            std::vector<uint32_t> aligned((data.size() + 3) / 4);
            memcpy(aligned.data(), data.data(), data.size());
            ox::core::CTexturesAlpha store;
            if ((ok = store.LoadFromMemory(aligned.data(), data.size(), path.c_str()))) {
                printf("%s: %u masks\n", path.c_str(), store.Count());
                for (uint32_t r = 0; r < store.Count(); ++r)
                    printf("  %s\n", ox::core::DescribeMask(store.Records()[r]).c_str());
            }
        } else {
            fprintf(stderr, "oxmedia: %s: unknown kind of file\n", path.c_str());
        }
        if (!ok) {
            fprintf(stderr, "oxmedia: %s is not valid\n", path.c_str());
            status = 1;
        }
    }
    return status;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 2)
        return UsageError("no command");
    std::string command = argv[1];
    if (command == "--help" || command == "-h") {
        fputs(kUsage, stdout);
        return 0;
    }
    struct Command {
        const char* name;
        int (*run)(int, char**);
        const char* help;
    } commands[] = {
        {"png", Png, kPngHelp}, {"jpeg", Jpeg, kJpegHelp}, {"pvr", Pvr, kPvrHelp},
        {"alpha", Alpha, kAlphaHelp}, {"ogg", Ogg, kOggHelp}, {"ogv", Ogv, kOgvHelp},
        {"info", Info, kInfoHelp},
    };
    for (const Command& c : commands) {
        if (command != c.name)
            continue;
        if (WantsHelp(argc, argv)) {
            fputs(c.help, stdout);
            if (c.run == Pvr)
                fputs(PvrFormatNames().c_str(), stdout);
            return 0;
        }
        oxtools::LogToStderr log("oxmedia");
        return c.run(argc, argv);
    }
    return UsageError("unknown command " + command);
}

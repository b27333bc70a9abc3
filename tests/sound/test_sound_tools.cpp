// The content tools for sounds end to end: the tones oxmedia writes play in the game's
// stream, and the declarations oxdump compiles are the game's own conversion.
#include "misc/GamePack.h"
#include "sound/OggVorbisStream.h"
#include "sound/SoundDeclarations.h"
#include "support/TestSupport.h"

#include <sys/wait.h>

#include <cstdlib>
#include <cstring>

using namespace ox::sound;

namespace {

int RunTool(const char* tool, const std::string& arguments, std::string* output = nullptr)
{
    oxtest::TempDir dir;
    const std::string file = (dir / "out").string();
    const int status = system((std::string(tool) + " " + arguments + " >'" + file + "' 2>&1").c_str());
    if (output)
        *output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

} // namespace

TEST(SoundTools, OxmediaWritesTonesTheStreamPlays)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    ASSERT_EQ(RunTool(OX_OXMEDIA_PATH, "ogg melody.ogg --tone 440:0.25,0:0.1,660 --seconds 0.15 --rate 22050 --channels 1"),
              0);
    ASSERT_EQ(RunTool(OX_OXMEDIA_PATH, "ogg cut.ogg --seconds 0.2 --no-end"), 0);
    std::string info;
    ASSERT_EQ(RunTool(OX_OXMEDIA_PATH, "info melody.ogg", &info), 0);
    EXPECT_EQ(info, "melody.ogg: Ogg Vorbis, 22050 Hz, mono, 0.500 s\n");

    const std::string melody = oxtest::ReadFile("melody.ogg");
    COggVorbisStream stream;
    ASSERT_TRUE(stream.OpenMemory(melody.data(), static_cast<unsigned>(melody.size()), "melody.ogg"));
    std::vector<int16_t> pcm(22050);
    EXPECT_EQ(stream.Read(pcm.data(), 44100), 2u * (5513 + 2205 + 3308)); // each tone rounded to whole frames
    // The rest between the tones is silent, the tones are not.
    auto peak = [&](double from, double to) {
        int top = 0;
        for (size_t i = static_cast<size_t>(from * 22050); i < static_cast<size_t>(to * 22050); ++i)
            top = std::max(top, std::abs(int(pcm[i])));
        return top;
    };
    EXPECT_GT(peak(0.05, 0.2), 15000);
    EXPECT_LT(peak(0.27, 0.33), 300);
    EXPECT_GT(peak(0.4, 0.45), 15000);

    const std::string cut = oxtest::ReadFile("cut.ogg");
    ASSERT_TRUE(stream.OpenMemory(cut.data(), static_cast<unsigned>(cut.size()), "cut.ogg"));
    EXPECT_TRUE(stream.IsStereo());
    EXPECT_DOUBLE_EQ(stream.GetLength(), 0.2);
    EXPECT_EQ(cut[cut.rfind("OggS") + 5] & 0x04, 0) << "the last page has no end-of-stream flag";

    EXPECT_EQ(RunTool(OX_OXMEDIA_PATH, "ogg bad.ogg --tone 30000"), 2);
    EXPECT_EQ(RunTool(OX_OXMEDIA_PATH, "ogg bad.ogg --channels 3"), 2);
}

TEST(SoundTools, OxdumpCompilesTheDeclarationsTheGameReads)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    const std::string xml = "<?xml version=\"1.0\"?>\n<sounds><sound_group flags=\"load_on_demand\">"
                            "<sound id=\"door\" file=\"Sfx\\Door.ogg\" group_template=\"sfx\" balance=\"-0.5\" "
                            "volume=\"80\" priority=\"2\" repeat=\"1\" max_concurrent_sound_play=\"3\" "
                            "concurrent_sound_play_delay=\"150\" speed=\"1\"/></sound_group></sounds>\n";
    dir.Write("properties/sounds.xml", xml);
    ASSERT_EQ(RunTool(OX_OXDUMP_PATH, "sounds properties/sounds.xml properties/sounds.bindump"), 0);
    std::vector<uint8_t> expected;
    ASSERT_TRUE(SoundDeclarationsLoader::ConvertXml(xml.data(), xml.size(), "sounds.xml", expected));
    EXPECT_EQ(oxtest::ReadFile("properties/sounds.bindump"), std::string(expected.begin(), expected.end()));

    std::string shown;
    ASSERT_EQ(RunTool(OX_OXDUMP_PATH, "show properties/sounds.bindump", &shown), 0);
    EXPECT_EQ(shown, "sound declarations: 1 sounds\nsound door file sfx/door.ogg group sfx balance -0.5 volume 80 "
                     "priority 2 repeat 1 max 3 delay 150 speed 1 flags 1\n");
    EXPECT_EQ(RunTool(OX_OXDUMP_PATH, "sounds properties/sounds.xml"), 2);
}

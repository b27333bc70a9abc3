// The dump tool end to end: what it writes for textures, the game reads record for record.
#include "core/TextureDeclarations.h"
#include "core/TexturesAlpha.h"
#include "misc/GamePack.h"
#include "misc/imagelib/MediaWriter.h"
#include "support/TestSupport.h"

#include <cstring>
#include <sys/wait.h>

using ox::core::CTextureDeclarationsLoader;

namespace {

int RunDump(const std::string& arguments, std::string* output = nullptr)
{
    oxtest::TempDir dir;
    const std::string file = (dir / "out").string();
    const int status = system((std::string(OX_OXDUMP_PATH) + " " + arguments + " >'" + file + "' 2>&1").c_str());
    if (output)
        *output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

void WritePng(const oxtest::TempDir& dir, const std::string& path, uint32_t w, uint32_t h, const char* pattern)
{
    std::vector<uint32_t> pixels;
    ASSERT_TRUE(ox::misc::imagelib::MakePattern(pattern, w, h, pixels));
    std::vector<uint8_t> png;
    ASSERT_TRUE(ox::misc::imagelib::EncodePng(pixels.data(), w, h, png));
    dir.Write(path, std::string(png.begin(), png.end()));
}

std::vector<uint32_t> Aligned(const std::string& bytes)
{
    std::vector<uint32_t> words(bytes.size() / 4 + 1);
    memcpy(words.data(), bytes.data(), bytes.size());
    return words;
}

} // namespace

TEST(OxDump, ResourcesDumpIsWhatTheLoaderBuildsAndReads)
{
    oxtest::TempDir game;
    oxtest::ScopedCwd cwd(game.Path());
    WritePng(game, "img/walk.png", 16, 4, "spinner");
    WritePng(game, "img/disc.png", 8, 8, "circle");
    const std::string xml = R"(<?xml version="1.0"?>
<resources><surfaces><surface path="img/walk.png"/><surface path="img/disc.png"/></surfaces>
<group id="g" flags="load_on_demand"><image id="walk" path="img/walk.png" anim_type="loop" cols="4" rows="1" frame_delay="50"/>
<group id="h"><image id="disc" path="img/disc.png" cols="1" rows="1"/></group></group></resources>)";
    game.Write("properties/resources.xml", xml);

    std::string text;
    ASSERT_EQ(RunDump("resources properties/resources.xml properties/resources.bindump", &text), 0) << text;
    EXPECT_NE(text.find("2 surfaces, 2 groups, 2 images"), std::string::npos) << text;
    EXPECT_FALSE(std::filesystem::exists(game / "properties/resources.bindump.tmp"));

    // Byte for byte what the library converts, and accepted by the game's check.
    const std::string dumped = oxtest::ReadFile(game / "properties/resources.bindump");
    ox::misc::GamePackConfig config;
    config.folder = game.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    std::vector<uint8_t> converted;
    ASSERT_TRUE(CTextureDeclarationsLoader(&pack).ConvertXml(xml.data(), xml.size(), "r", converted));
    EXPECT_EQ(dumped, std::string(converted.begin(), converted.end()));

    CTextureDeclarationsLoader loader(&pack);
    ASSERT_TRUE(loader.Load()) << "the dump is found before the XML";
    ASSERT_EQ(loader.ImagesAmount(), 2u);
    const auto* walk = loader.Desc(*loader.FindImage("walk"));
    EXPECT_EQ(walk->parts_amount, 4);
    EXPECT_EQ(walk->total_time, 200);
    EXPECT_EQ(walk->frame_width, 4);
    EXPECT_STREQ(loader.Surfaces()[loader.SurfaceIndex(*walk)].path.c_str(), "img/walk.png");

    ASSERT_EQ(RunDump("show properties/resources.bindump", &text), 0) << text;
    EXPECT_NE(text.find("image walk surface img/walk.png group g frame 4x4 cols 4 rows 1 anim loop"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("group h flags 0 parent g"), std::string::npos) << text;

    // A dump of another revision is refused by name.
    std::string spoilt = dumped;
    spoilt[3] = 2;
    game.Write("bad.bindump", spoilt);
    EXPECT_EQ(RunDump("show bad.bindump", &text), 1);
    EXPECT_NE(text.find("Current revision: 1, bindump's revision2"), std::string::npos) << text;
    EXPECT_EQ(RunDump("resources missing.xml out.bindump", &text), 1);
    EXPECT_EQ(RunDump("resources --help", &text), 0);
    EXPECT_NE(text.find("usage: oxdump resources"), std::string::npos);
}

TEST(OxDump, AlphaMasksFromAFolderOrAListAndStringsShown)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    WritePng(dir, "art/ui/disc.png", 12, 10, "circle");
    WritePng(dir, "art/stripes.png", 9, 4, "stripes");
    std::string text;
    ASSERT_EQ(RunDump("texturesalpha art masks.bindump --order rows", &text), 0) << text;
    const std::string table = oxtest::ReadFile(dir / "masks.bindump");
    std::vector<uint32_t> words = Aligned(table);
    ox::core::CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(words.data(), table.size()));
    EXPECT_EQ(store.Count(), 2u);
    EXPECT_TRUE(store.IsOpaque("disc", 6, 5));
    EXPECT_FALSE(store.IsOpaque("disc", 0, 0));
    EXPECT_FALSE(store.IsOpaque("stripes", 1, 0));
    EXPECT_EQ(store.Find("disc")->order, 1);

    dir.Write("list.txt", "# masks\nround=art/ui/disc.png\n\nart/stripes.png\n");
    ASSERT_EQ(RunDump("texturesalpha list.txt listed.bindump", &text), 0) << text;
    ASSERT_EQ(RunDump("show listed.bindump", &text), 0);
    EXPECT_NE(text.find("mask round 12x10"), std::string::npos) << text;
    EXPECT_NE(text.find("mask stripes 9x4"), std::string::npos) << text;
    dir.Write("twice.txt", "a=art/stripes.png\na=art/ui/disc.png\n");
    EXPECT_EQ(RunDump("texturesalpha twice.txt t.bindump", &text), 1) << "ids must differ";

    dir.Write("strings.xml", "<?xml version=\"1.0\"?><strings><s id=\"7\">Door</s><s id=\"3\">Key</s></strings>");
    ASSERT_EQ(RunDump("strings strings.xml strings.bindump", &text), 0) << text;
    ASSERT_EQ(RunDump("show strings.bindump", &text), 0);
    EXPECT_NE(text.find("3: Key\n7: Door"), std::string::npos) << text;
    dir.Write("junk.bindump", "JUNKJUNKJUNK");
    EXPECT_EQ(RunDump("show junk.bindump", &text), 1);
    EXPECT_NE(text.find("unknown kind of dump"), std::string::npos);
}

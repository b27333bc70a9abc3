// The media tool end to end: what it writes, the game reads.
#include "core/TexturesAlpha.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/MediaWriter.h"
#include "misc/imagelib/PvrContainer.h"
#include "support/TestSupport.h"

#include <cstdlib>
#include <sys/wait.h>

using namespace ox::misc::imagelib;

namespace {

int RunMedia(const std::string& arguments, std::string* output = nullptr)
{
    oxtest::TempDir dir;
    std::string file = (dir / "out").string();
    int status = system((std::string(OX_OXMEDIA_PATH) + " " + arguments + " >'" + file + "' 2>&1").c_str());
    if (output)
        *output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

} // namespace

TEST(OxMedia, GeneratesConvertsAndBuildsWhatTheGameReads)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    ASSERT_EQ(RunMedia("png disc.png --size 24x16 --pattern circle --layout palette --interlace"), 0);
    ASSERT_EQ(RunMedia("jpeg photo.jpg --size 20x10 --pattern gradient --quality 70 --grey"), 0);
    ASSERT_EQ(RunMedia("pvr disc.png disc.pvrlzo --format dxt5"), 0);
    ASSERT_EQ(RunMedia("alpha texturesalpha.bindump --order columns ui/disc=disc.png photo.jpg"), 0);

    Image disc;
    ASSERT_TRUE(LoadImage("disc.png", disc));
    std::vector<uint32_t> expected;
    ASSERT_TRUE(MakePattern("circle", 24, 16, expected));
    EXPECT_EQ(disc.pixels, expected);
    uint32_t w = 0, h = 0;
    EXPECT_TRUE(GetImageInfo("photo.jpg", w, h));
    EXPECT_EQ(w, 20u);
    unsigned format = 0;
    ASSERT_TRUE(PvrGetInfo("disc.pvrlzo", w, h, format));
    EXPECT_EQ(format, 15u);
    EXPECT_EQ(h, 16u);

    std::string table = oxtest::ReadFile("texturesalpha.bindump");
    std::vector<uint32_t> aligned(table.size() / 4 + 1);
    memcpy(aligned.data(), table.data(), table.size());
    ox::core::CTexturesAlpha store;
    ASSERT_TRUE(store.LoadFromMemory(aligned.data(), table.size()));
    EXPECT_TRUE(store.IsOpaque("ui/disc", 12, 8));
    EXPECT_FALSE(store.IsOpaque("ui/disc", 0, 0));
    EXPECT_EQ(store.Find("ui/disc")->order, 0);
    EXPECT_TRUE(store.Find("photo")->uniform) << "a JPEG is solid everywhere";

    std::string text;
    EXPECT_EQ(RunMedia("info disc.png disc.pvrlzo texturesalpha.bindump", &text), 0);
    EXPECT_NE(text.find("disc.pvrlzo: 24x16, surface format 15"), std::string::npos) << text;
    EXPECT_NE(text.find("photo 20x10 uniform solid"), std::string::npos) << text;
}

TEST(OxMedia, HelpUsageErrorsAndBadInput)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    std::string text;
    for (const char* command : {"png", "jpeg", "pvr", "alpha", "info"}) {
        EXPECT_EQ(RunMedia(std::string(command) + " --help", &text), 0) << command;
        EXPECT_EQ(text.rfind(std::string("usage: oxmedia ") + command, 0), 0u) << text;
    }
    EXPECT_EQ(RunMedia("pvr --help", &text), 0);
    EXPECT_NE(text.find("dxt1"), std::string::npos);
    EXPECT_EQ(RunMedia("png a.png --size 0x5"), 2);
    EXPECT_EQ(RunMedia("pvr a.png b.pvr --format pvrtc"), 2);
    EXPECT_EQ(RunMedia("frobnicate"), 2);
    EXPECT_EQ(RunMedia("png a.png --pattern plaid"), 1);

    // A broken image is refused, with the library's reason on standard error.
    dir.Write("broken.png", "\x89PNG\r\n\x1a\n and then nothing useful");
    EXPECT_EQ(RunMedia("pvr broken.png out.pvr", &text), 1);
    EXPECT_NE(text.find("PNG error in \"broken.png\""), std::string::npos) << text;
    EXPECT_FALSE(std::filesystem::exists(dir / "out.pvr"));
}

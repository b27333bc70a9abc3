#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "misc/sys/Path.h"
#include "support/TestSupport.h"

#include <cstdlib>
#include <map>

using namespace ox::misc;
namespace fs = std::filesystem;

namespace {

std::map<std::string, std::string> ReadTree(const fs::path& root)
{
    std::map<std::string, std::string> files;
    for (const auto& item : fs::recursive_directory_iterator(root))
        if (item.is_regular_file())
            files[item.path().lexically_relative(root).generic_string()] = oxtest::ReadFile(item.path());
    return files;
}

int RunTool(const std::string& command) { return WEXITSTATUS(system((command + " >/dev/null 2>&1").c_str())); }

} // namespace

TEST(PackWriter, FolderRoundTripThroughTheGameAndTheTool)
{
    oxtest::TempDir source, game, extracted;
    std::string big(100000, '\0');
    for (size_t i = 0; i < big.size(); ++i)
        big[i] = static_cast<char>(i * 7 + i / 251);
    source.Write("properties/gui.xml", "<gui/>");
    source.Write("!langs/de/properties/gui.xml", "<gui lang='de'/>");
    source.Write("!langs/fr/scripts/main.lua", "-- fr");
    source.Write("scripts/main.lua", "-- main");
    source.Write("textures/big.bin", big);
    source.Write("textures/odd", "12345");
    source.Write("z_empty", "");
    auto expected = ReadTree(source.Path());

    CPackWriter writer;
    ASSERT_TRUE(writer.AddFolder(source.Path())) << writer.Error();
    ASSERT_TRUE(writer.Write(game / "game.pack")) << writer.Error();
    EXPECT_EQ(ReadTree(game.Path()).size(), 1u) << "no temporary file is left behind";

    GamePackConfig config;
    config.folder = game.Path().string();
    config.language = "de";
    CGamePack pack(config);
    ASSERT_TRUE(pack.HasPack()) << pack.PackError();
    ASSERT_EQ(pack.EntryCount(), expected.size());
    for (const auto& [path, data] : expected) {
        unsigned size = 0;
        const void* bytes = pack.Open(path.c_str(), &size);
        ASSERT_NE(bytes, nullptr) << path;
        std::string wanted = path == "properties/gui.xml" ? expected["!langs/de/properties/gui.xml"] : data;
        EXPECT_EQ(std::string(static_cast<const char*>(bytes), size), wanted) << path;
        EXPECT_EQ(pack.GetSize(bytes), size);
        pack.Close(bytes);
    }
    EXPECT_TRUE(pack.IsLocalized("properties/gui.xml"));
    EXPECT_FALSE(pack.IsLocalized("scripts/main.lua"));

    // The tool, packing the folder into itself, leaves its old pack out; it extracts what
    // it built byte for byte and lists it with the game's CRC.
    std::string tool = OX_OXPACK_PATH;
    fs::path toolPack = source / "game.pack";
    source.Write("game.pack", "an old pack");
    ASSERT_EQ(RunTool(tool + " build '" + source.Path().string() + "' '" + toolPack.string() + "'"), 0);
    EXPECT_EQ(oxtest::ReadFile(toolPack), oxtest::ReadFile(game / "game.pack"));
    ASSERT_EQ(RunTool(tool + " extract '" + toolPack.string() + "' '" + extracted.Path().string() + "'"), 0);
    EXPECT_EQ(ReadTree(extracted.Path()), expected);
    fs::path listFile = game / "list";
    ASSERT_EQ(system((tool + " list '" + toolPack.string() + "' > '" + listFile.string() + "'").c_str()), 0);
    std::string list = oxtest::ReadFile(listFile);
    char line[64];
    snprintf(line, sizeof(line), "textures/odd\t5\t%08x\n", sys::CalcCRC("12345", 5));
    EXPECT_NE(list.find(line), std::string::npos) << list;
    EXPECT_EQ(list.rfind("!langs/de/properties/gui.xml\t16\t", 0), 0u) << "table order, overlays first";
    EXPECT_EQ(RunTool(tool + " list"), 2) << "a usage error";
    EXPECT_EQ(RunTool(tool + " list '" + (source / "scripts/main.lua").string() + "'"), 1) << "not a pack";
}

TEST(PackWriter, RefusesPathsThePackCannotHold)
{
    CPackWriter writer;
    EXPECT_TRUE(writer.AddData(std::string(111, 'a'), "x"));
    EXPECT_FALSE(writer.AddData(std::string(112, 'a'), "x"));
    EXPECT_NE(writer.Error().find("longer than 111"), std::string::npos);
    EXPECT_TRUE(writer.AddData("!langs/en/" + std::string(100, 'b'), "x"));
    EXPECT_FALSE(writer.AddData("!langs/en/" + std::string(101, 'b'), "x")) << "a translation this long is never found";
    EXPECT_FALSE(writer.AddData(std::string(111, 'a'), "y"));
    EXPECT_NE(writer.Error().find("added twice"), std::string::npos);
    for (const char* bad : {"", "/abs", "a//b", "a/../b", "./a", "a\\b", "a/", "!langs/en"})
        EXPECT_FALSE(writer.AddData(bad, "x")) << bad;
    EXPECT_EQ(writer.Count(), 2u);
}

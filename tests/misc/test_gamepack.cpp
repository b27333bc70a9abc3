#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "misc/Unicode.h"
#include "misc/sys/MemMap.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <cstring>
#include <map>
#include <random>

using namespace ox::misc;
using Files = std::map<std::string, std::string>;

namespace {

std::string MakePack(const Files& files)
{
    CPackWriter writer;
    for (const auto& [path, data] : files)
        EXPECT_TRUE(writer.AddData(path, data)) << writer.Error();
    std::string image;
    EXPECT_TRUE(writer.Build(image)) << writer.Error();
    return image;
}

GamePackConfig Config(const oxtest::TempDir& dir, const char* language)
{
    GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = language;
    return config;
}

// The text Open gives for a path, "<null>" for nothing; the pointer is given back.
std::string Read(CGamePack& pack, const char* path)
{
    unsigned size = 12345;
    const void* data = pack.Open(path, &size);
    if (!data)
        return size == 0 ? "<null>" : "<null with a size>";
    std::string text(static_cast<const char*>(data), size);
    EXPECT_EQ(pack.GetSize(data), size) << path;
    pack.Close(data);
    return text;
}

std::vector<std::string> Enum(const CGamePack& pack, const char* prefix)
{
    std::vector<std::string> paths;
    unsigned count = pack.EnumFiles(prefix, [](void* user, const char* path) {
        static_cast<std::vector<std::string>*>(user)->push_back(path);
    }, &paths);
    EXPECT_EQ(count, paths.size());
    return paths;
}

} // namespace

TEST(GamePack, LookUpOrderOverlayPackLooseOverlayLoose)
{
    oxtest::TempDir dir;
    dir.Write("game.pack", MakePack({{"!langs/en/a.txt", "pack en a"}, {"a.txt", "pack a"}, {"b.txt", "pack b"},
                                     {"!langs/ru/d.txt", "pack ru d"}}));
    dir.Write("!langs/en/b.txt", "loose en b");
    dir.Write("b.txt", "loose b");
    dir.Write("!langs/en/c.txt", "loose en c");
    dir.Write("c.txt", "loose c");
    dir.Write("d.txt", "loose d");
    dir.Write("sub\\x.txt", "");
    dir.Write("sub/x.txt", "loose sub x");

    CGamePack pack(Config(dir, "en"));
    ASSERT_TRUE(pack.HasPack()) << pack.PackError();
    EXPECT_TRUE(pack.HasOverlay());
    EXPECT_EQ(Read(pack, "a.txt"), "pack en a");
    EXPECT_EQ(Read(pack, "b.txt"), "pack b") << "the pack beats every loose file";
    EXPECT_EQ(Read(pack, "c.txt"), "loose en c");
    EXPECT_EQ(Read(pack, "d.txt"), "loose d") << "another language's overlay is not used";
    EXPECT_EQ(Read(pack, "sub\\x.txt"), "loose sub x") << "a backslash separates loose paths";
    EXPECT_EQ(Read(pack, "e.txt"), "<null>");
    EXPECT_EQ(Read(pack, "A.txt"), "<null>") << "paths match with their exact case";
    EXPECT_EQ(Read(pack, "!langs/ru/d.txt"), "pack ru d");

    EXPECT_TRUE(pack.IsLocalized("a.txt"));
    EXPECT_FALSE(pack.IsLocalized("b.txt"));
    EXPECT_TRUE(pack.IsLocalized("c.txt"));
    EXPECT_FALSE(pack.IsLocalized("d.txt"));
    for (const char* path : {"a.txt", "b.txt", "c.txt", "d.txt"})
        EXPECT_TRUE(pack.Access(path)) << path;
    EXPECT_FALSE(pack.Access("e.txt"));

    CGamePack plain(Config(dir, ""));
    EXPECT_FALSE(plain.HasLanguage());
    EXPECT_EQ(Read(plain, "a.txt"), "pack a");
    EXPECT_EQ(Read(plain, "c.txt"), "loose c");
    EXPECT_FALSE(plain.IsLocalized("c.txt"));

    std::filesystem::remove(dir / "game.pack");
    CGamePack loose(Config(dir, "en"));
    EXPECT_FALSE(loose.HasPack());
    EXPECT_EQ(Read(loose, "b.txt"), "loose en b");
    EXPECT_EQ(Read(loose, "a.txt"), "<null>");
}

TEST(GamePack, LanguageWithRegionFallsBackToItsBase)
{
    oxtest::TempDir dir;
    dir.Write("game.pack", MakePack({{"!langs/pt/a.txt", "pt a"}, {"!langs/pt-BR/b.txt", "pt-BR b"}, {"a.txt", "a"}}));
    CGamePack brazil(Config(dir, "pt-BR"));
    EXPECT_STREQ(brazil.GetLanguage(), "pt-BR");
    EXPECT_EQ(Read(brazil, "a.txt"), "a") << "only the overlay of the full code is used";
    EXPECT_EQ(Read(brazil, "b.txt"), "pt-BR b");

    CGamePack portugal(Config(dir, "pt-PT"));
    EXPECT_STREQ(portugal.GetLanguage(), "pt");
    EXPECT_EQ(Read(portugal, "a.txt"), "pt a");

    CGamePack german(Config(dir, "de-AT"));
    EXPECT_STREQ(german.GetLanguage(), "de") << "the cut code stays without an overlay";
    EXPECT_FALSE(german.HasOverlay());
    EXPECT_TRUE(german.HasLanguage());
}

TEST(GamePack, SearchFindsEveryMemberAndNothingElse)
{
    oxtest::TempDir empty;
    std::mt19937 random(17);
    const std::string alphabet = "ab/!\x80\xE9z.";
    for (size_t count : {0, 1, 2, 3, 4, 5, 8, 60}) {
        Files files;
        while (files.size() < count) {
            std::string path;
            size_t length = 1 + random() % 6;
            for (size_t i = 0; i < length; ++i)
                path += alphabet[random() % alphabet.size()];
            if (random() % 4 == 0 && !files.empty())
                path = files.begin()->first + path; // longer paths sharing a prefix
            if (CPackWriter::CheckPath(path).empty())
                files[path] = "data of " + path;
        }
        if (count == 60)
            files["!langs/en/x"] = "overlay";
        std::string image = MakePack(files);
        std::vector<uint32_t> aligned((image.size() + 3) / 4);
        memcpy(aligned.data(), image.data(), image.size());
        CGamePack pack(aligned.data(), image.size(), Config(empty, ""));
        ASSERT_TRUE(pack.HasPack()) << pack.PackError();
        ASSERT_EQ(pack.EntryCount(), files.size());

        for (const auto& [path, data] : files) {
            EXPECT_EQ(Read(pack, path.c_str()), data) << count << " entries";
            std::string before = path.substr(0, path.size() - 1), after = path + "\x01", bigger = path + "\xFF";
            for (const std::string& other : {before, after, bigger}) {
                if (!files.count(other) && !other.empty()) {
                    EXPECT_EQ(Read(pack, other.c_str()), "<null>") << count << " entries: " << other;
                }
            }
        }
        EXPECT_EQ(Read(pack, "0"), "<null>") << "in front of every entry";
        EXPECT_EQ(Read(pack, "\xFF\xFF"), "<null>") << "behind every entry";

        // Prefix search against a plain walk of the sorted paths.
        for (const std::string& prefix : {std::string("a"), std::string("ab"), std::string("\x80"),
                                          std::string("!"), std::string("zz"), std::string("b/")}) {
            std::vector<std::string> expected;
            for (const auto& [path, data] : files)
                if (path.compare(0, prefix.size(), prefix) == 0)
                    expected.push_back(path);
            EXPECT_EQ(Enum(pack, prefix.c_str()), expected) << count << " entries, prefix " << prefix;
        }
    }
}

TEST(GamePack, PointersSizesAndClose)
{
    oxtest::TempDir dir;
    dir.Write("game.pack", MakePack({{"one", "1"}, {"three", "333"}, {"zero", ""}}));
    dir.Write("loose.bin", "loose bytes");
    dir.Write("empty.bin", "");
    CGamePack pack(Config(dir, ""));

    unsigned size = 0;
    const void* three = pack.Open("three", &size);
    ASSERT_NE(three, nullptr);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(three) % 4, 0u);
    EXPECT_EQ(pack.GetSize(three), 3u);
    pack.Close(three);
    EXPECT_EQ(pack.Open("three", nullptr), three) << "a pack pointer stays valid after Close";

    const void* zero = pack.Open("zero", &size);
    EXPECT_NE(zero, nullptr) << "an empty file in the pack exists";
    EXPECT_EQ(size, 0u);
    EXPECT_EQ(pack.GetSize(zero), 0u);

    size_t mapped = sys::MappedFileCount();
    const void* loose = pack.Open("loose.bin", &size);
    ASSERT_NE(loose, nullptr);
    EXPECT_EQ(pack.GetSize(loose), 11u);
    EXPECT_EQ(sys::MappedFileCount(), mapped + 1);
    pack.Close(loose);
    EXPECT_EQ(sys::MappedFileCount(), mapped);

    EXPECT_EQ(pack.Open("empty.bin", &size), nullptr) << "an empty loose file counts as missing";
    EXPECT_TRUE(pack.Access("empty.bin"));
}

TEST(GamePack, EnumFiles)
{
    oxtest::TempDir dir;
    dir.Write("game.pack", MakePack({{"!langs/en/s/a", ""}, {"s/a", ""}, {"s/b/c", ""}, {"t", ""}}));
    dir.Write("s/x", "x");
    dir.Write("s/deeper/y", "y");
    CGamePack pack(Config(dir, "en"));
    EXPECT_EQ(Enum(pack, ""), (std::vector<std::string>{"!langs/en/s/a", "s/a", "s/b/c", "t"}));
    EXPECT_EQ(Enum(pack, "s/"), (std::vector<std::string>{"s/a", "s/b/c"})) << "loose folders are not looked at";
    EXPECT_EQ(Enum(pack, "u"), std::vector<std::string>{});

    std::filesystem::remove(dir / "game.pack");
    CGamePack loose(Config(dir, "en"));
    EXPECT_EQ(Enum(loose, ""), std::vector<std::string>{});
    EXPECT_EQ(Enum(loose, "s"), std::vector<std::string>{"s/x"}) << "plain files only, no recursion";
    EXPECT_EQ(Enum(loose, "s/"), std::vector<std::string>{"s/x"});
    EXPECT_CONTRACT_FAILURE(loose.EnumFiles(nullptr, nullptr, nullptr), "_prefix");
}

TEST(GamePack, BrokenPacksAreRefusedAndLooseFilesServe)
{
    const std::string good = MakePack({{"a.txt", "pack a"}, {"b.txt", "pack b"}});
    auto entry = [](std::string& image, int index, size_t field) -> char* {
        return image.data() + sizeof(PackHeader) + index * sizeof(PackEntry) + field;
    };
    auto put32 = [](char* at, uint32_t value) { memcpy(at, &value, 4); };
    struct Case {
        const char* name;
        std::function<void(std::string&)> damage;
        const char* log;
    };
    const Case cases[] = {
        {"wrong magic", [](std::string& p) { p[0] = 'X'; }, "game.pack is invalid"},
        {"other revision", [](std::string& p) { p[3] = 2; }, "game.pack is invalid"},
        {"total size + 1", [&](std::string& p) { put32(&p[8], uint32_t(p.size() + 1)); }, "game.pack is invalid"},
        {"truncated", [](std::string& p) { p.resize(p.size() - 4); }, "game.pack is invalid"},
        {"header only", [](std::string& p) { p.resize(10); }, "game.pack is invalid"},
        {"table past the end", [&](std::string& p) { put32(&p[4], 1000); }, "runs past the end of the file"},
        {"wrong hash", [&](std::string& p) { entry(p, 1, 4)[0] ^= 1; }, "entry 1 (b.txt): the hash does not match"},
        {"hash 0", [&](std::string& p) { memset(entry(p, 0, 4), 0, 2); }, "the hash does not match"},
        {"unterminated", [&](std::string& p) { memset(entry(p, 0, 8), 'q', 112); }, "not a valid string"},
        {"size past path", [&](std::string& p) { entry(p, 0, 0)[0] = 112; }, "not a valid string"},
        {"capacity", [&](std::string& p) { entry(p, 0, 2)[0] = 88; }, "not a valid string"},
        {"unsorted", [&](std::string& p) { std::swap_ranges(entry(p, 0, 0), entry(p, 1, 0), entry(p, 1, 0)); },
         "out of order"},
        {"repeated", [&](std::string& p) { memcpy(entry(p, 1, 0), entry(p, 0, 0), 120); }, "out of order"},
        {"misaligned", [&](std::string& p) { put32(entry(p, 0, 124), 270); }, "not a multiple of 4"},
        {"over the table", [&](std::string& p) { put32(entry(p, 0, 124), 140); }, "overlaps the table"},
        {"past the end", [&](std::string& p) { put32(entry(p, 1, 120), 100); }, "past the end of the file"},
        {"starts at the end", [&](std::string& p) { put32(entry(p, 1, 120), 0); put32(entry(p, 1, 124), uint32_t(p.size())); },
         "past the end of the file"},
        {"offset far out", [&](std::string& p) { put32(entry(p, 1, 124), 0xFFFFFFFC); }, "past the end of the file"},
    };
    for (const Case& c : cases) {
        std::string image = good;
        c.damage(image);
        oxtest::TempDir dir;
        dir.Write("game.pack", image);
        dir.Write("a.txt", "loose a");
        oxtest::LogCapture log;
        size_t mapped = sys::MappedFileCount();
        CGamePack pack(Config(dir, "en"));
        EXPECT_FALSE(pack.HasPack()) << c.name;
        EXPECT_EQ(sys::MappedFileCount(), mapped) << c.name << ": the mapping is released";
        EXPECT_EQ(Read(pack, "a.txt"), "loose a") << c.name;
        EXPECT_EQ(Read(pack, "b.txt"), "<null>") << c.name;
        auto lines = log.Entries();
        EXPECT_TRUE(std::any_of(lines.begin(), lines.end(), [&](const std::string& line) {
            return line.rfind("gamepack|3|game.pack is invalid", 0) == 0 && line.find(c.log) != std::string::npos;
        })) << c.name;
    }

    // A size word that does not repeat the entry's size drops that file only.
    std::string image = good;
    put32(image.data() + *reinterpret_cast<const uint32_t*>(entry(image, 0, 124)) - 4, 99);
    oxtest::TempDir dir;
    dir.Write("game.pack", image);
    dir.Write("a.txt", "loose a");
    oxtest::LogCapture log;
    CGamePack pack(Config(dir, ""));
    EXPECT_TRUE(pack.HasPack());
    EXPECT_EQ(Read(pack, "a.txt"), "loose a");
    EXPECT_EQ(Read(pack, "b.txt"), "pack b");
    EXPECT_TRUE(log.Contains("[gamepack][3]: game.pack: the size in front of a.txt (99) differs from its entry (6)"));
}

TEST(GamePack, EmptyPackAndLanguageLog)
{
    oxtest::TempDir dir;
    dir.Write("game.pack", MakePack({}));
    dir.Write("a.txt", "loose a");
    oxtest::LogCapture log;
    CGamePack pack(Config(dir, "en"));
    EXPECT_TRUE(pack.HasPack());
    EXPECT_EQ(pack.EntryCount(), 0u);
    EXPECT_EQ(Read(pack, "a.txt"), "loose a");
    CGamePack none(Config(dir, ""));
    auto entries = log.Entries();
    EXPECT_NE(std::find(entries.begin(), entries.end(), "gamepack|1|User preferred language: en"), entries.end());
    EXPECT_NE(std::find(entries.begin(), entries.end(),
                        "gamepack|1|GetCurrentUserPreferredLanguage() returned false"), entries.end());
}

TEST(MemMap, TableOf256SlotsAndItsContracts)
{
    oxtest::TempDir dir;
    std::string path = dir.Write("f", "data").string();
    std::vector<const void*> maps;
    while (sys::MappedFileCount() < sys::kMaxMappedFiles) {
        maps.push_back(sys::MapFile(path.c_str(), nullptr));
        ASSERT_NE(maps.back(), nullptr);
    }
    unsigned size = 7;
    EXPECT_CONTRACT_FAILURE(EXPECT_EQ(sys::MapFile(path.c_str(), &size), nullptr), "slot != nullptr");
    EXPECT_EQ(size, 0u);
    for (const void* map : maps)
        sys::UnmapFile(map);

    const void* map = sys::MapFile(u"f", nullptr);
    EXPECT_EQ(map, nullptr) << "relative to the working folder, which is elsewhere";
    map = sys::MapFile(ox::misc::Utf8ToWide(path).c_str(), &size);
    ASSERT_NE(map, nullptr);
    EXPECT_EQ(sys::GetMappedSize(map), 4u);
    sys::UnmapFile(map);
    EXPECT_CONTRACT_FAILURE(sys::UnmapFile(map), "slot != nullptr");
    EXPECT_CONTRACT_FAILURE(sys::UnmapFile(nullptr), "_map");
    EXPECT_EQ(sys::MapFile(dir.Path().c_str(), nullptr), nullptr) << "a folder is not mapped";
}

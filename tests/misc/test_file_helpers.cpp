#include "misc/Unicode.h"
#include "misc/sys/Language.h"
#include "misc/sys/MemMap.h"
#include "misc/sys/Path.h"
#include "support/TestSupport.h"

#include <sys/stat.h>

using namespace ox::misc;
using namespace ox::misc::sys;
namespace fs = std::filesystem;

namespace {

ox::wstring W(const fs::path& path) { return Utf8ToWide(path.string()); }

unsigned Mode(const fs::path& path)
{
    struct stat info;
    stat(path.c_str(), &info);
    return info.st_mode & 0777;
}

} // namespace

TEST(FileHelpers, CrcOfTheSystemsOwnForm)
{
    oxtest::TempDir dir;
    size_t mapped = MappedFileCount();
    EXPECT_EQ(static_cast<uint32_t>(CalcFileCRC(W(dir.Write("check", "123456789")))), 0x2DFD2D88u)
        << "start 0 and no final inversion: not zlib's 0xCBF43926";
    EXPECT_EQ(CalcCRC("56789", 5, CalcCRC("1234", 4)), 0x2DFD2D88u) << "a CRC goes on from a previous one";
    EXPECT_EQ(CalcFileCRC(W(dir / "missing")), -1);
    EXPECT_EQ(CalcFileCRC(W(dir.Write("empty", ""))), -1);
    EXPECT_EQ(MappedFileCount(), mapped);
}

TEST(FileHelpers, GzipRoundTripAndDamagedInput)
{
    oxtest::TempDir dir;
    std::string data;
    for (int i = 0; i < 90000; ++i)
        data += static_cast<char>((i * 31) ^ (i >> 7));
    dir.Write("plain", data);
    ASSERT_TRUE(Compress(W(dir / "plain"), W(dir / "packed.gz")));
    std::string packed = oxtest::ReadFile(dir / "packed.gz");
    ASSERT_GT(packed.size(), 10u);
    EXPECT_EQ(packed.substr(0, 2), "\x1f\x8b");
    ASSERT_TRUE(Uncompress(W(dir / "packed.gz"), W(dir / "back")));
    EXPECT_EQ(oxtest::ReadFile(dir / "back"), data);

    dir.Write("cut.gz", packed.substr(0, packed.size() / 2));
    dir.Write("out", "previous");
    EXPECT_FALSE(Uncompress(W(dir / "cut.gz"), W(dir / "out")));
    EXPECT_EQ(oxtest::ReadFile(dir / "out"), "previous") << "a failure leaves the destination as it was";
    EXPECT_FALSE(Compress(W(dir / "missing"), W(dir / "x.gz")));
    EXPECT_FALSE(Uncompress(W(dir / "missing"), W(dir / "x")));
    EXPECT_FALSE(Compress(W(dir / "plain"), W(dir / "no/such/folder.gz")));
    EXPECT_EQ(std::distance(fs::directory_iterator(dir.Path()), fs::directory_iterator()), 5)
        << "no temporary file is left behind";
}

TEST(FileHelpers, PathEditing)
{
    struct { const char16_t* path; bool result; const char16_t* after; } cuts[] = {
        {u"", false, u""}, {u"a", false, u"a"}, {u"ab", true, u""}, {u"a/b", true, u"a"},
        {u"a\\b\\c.txt", true, u"a\\b"}, {u"/a", true, u""}, {u"a/b/", false, u"a/b/"},
    };
    for (const auto& cut : cuts) {
        ox::wstring path = cut.path;
        EXPECT_EQ(RemoveLastPathPart(path), cut.result) << oxtest::Narrow(cut.path);
        EXPECT_EQ(path, cut.after) << oxtest::Narrow(cut.path);
    }

    EXPECT_EQ(AppendPath(u"a", u"b"), u"a/b");
    EXPECT_EQ(AppendPath(u"a\\", u"/b/c"), u"a/b/c");
    EXPECT_EQ(AppendPath(u"/", u"b"), u"/b");
    EXPECT_EQ(AppendPath(u"", u"b"), u"b");
    EXPECT_EQ(AppendPath(u"a", u""), u"a");
    EXPECT_EQ(NativePath(u"a\\b/\u00e9"), "a/b/\xc3\xa9");
}

TEST(FileHelpers, FoldersListingAndAccess)
{
    oxtest::TempDir dir;
    fs::path deep = dir / "x/y/z";
    EXPECT_FALSE(CheckExistPath(W(deep)));
    EXPECT_TRUE(CreateFolder(W(deep)));
    EXPECT_TRUE(CreateFolder(W(deep))) << "an existing folder is fine";
    EXPECT_TRUE(CheckExistPath(W(deep)));
    EXPECT_FALSE(CreateFolder(W(dir.Write("file", "")) + u"/sub"));

    dir.Write("list/b.XML", "");
    dir.Write("list/a.xml", "");
    dir.Write("list/c.txt", "");
    fs::create_directory(dir / "list/d.xml");
    std::vector<ox::wstring> found{u"kept"};
    ListFiles(found, (W(dir / "list") + u"\\*.xml").c_str());
    ox::wstring folder = W(dir / "list/");
    EXPECT_EQ(found, (std::vector<ox::wstring>{u"kept", folder + u"a.xml", folder + u"b.XML", folder + u"d.xml"}));
    found.clear();
    ListFiles(found, (W(dir / "list") + u"/?.txt").c_str());
    EXPECT_EQ(found, std::vector<ox::wstring>{folder + u"c.txt"});
    EXPECT_CONTRACT_FAILURE(ListFiles(found, ox::wstring(500, u'a').c_str()), "wcslen(_path_and_name_of_folder)<500");

    {
        oxtest::ScopedCwd cwd(dir.Path());
        EXPECT_EQ(GetCurrentDirectory(), W(fs::current_path()));
        EXPECT_TRUE(SetCurrentDirectory(u"list"));
        EXPECT_EQ(GetCurrentDirectory(), W(dir / "list"));
        found.clear();
        ListFiles(found, u"*.txt");
        EXPECT_EQ(found, std::vector<ox::wstring>{u"c.txt"});
        EXPECT_FALSE(SetCurrentDirectory(u"missing"));
    }

    // Full access is the owner's read and write (and search for folders), and only inside the root.
    fs::create_directories(dir / "open/inner");
    dir.Write("open/inner/f", "");
    dir.Write("beside", "");
    chmod((dir / "open").c_str(), 0500);
    chmod((dir / "open/inner").c_str(), 0575);
    chmod((dir / "open/inner/f").c_str(), 0466);
    chmod((dir / "beside").c_str(), 0400);
    SetFullAccessRoot(u"");
    SetNamedFullAccess(W(dir / "open"), true);
    EXPECT_EQ(Mode(dir / "open"), 0500u) << "no root: nothing is changed";
    SetFullAccessRoot(W(dir / "open"));
    SetNamedFullAccess(W(dir / "open"), false);
    EXPECT_EQ(Mode(dir / "open"), 0700u);
    EXPECT_EQ(Mode(dir / "open/inner"), 0575u);
    SetNamedFullAccess(W(dir / "open"), true);
    EXPECT_EQ(Mode(dir / "open/inner"), 0755u) << "group and others lose write access";
    EXPECT_EQ(Mode(dir / "open/inner/f"), 0644u) << "files get read and write, not execute";
    SetNamedFullAccess(W(dir / "beside"), false);
    SetNamedFullAccess(W(dir / "open/inner/../../beside"), false);
    EXPECT_EQ(Mode(dir / "beside"), 0400u) << "outside the root";
    SetFullAccessRoot(u"");
}

TEST(Language, FromTheLocaleEnvironment)
{
    EXPECT_EQ(LanguageFromLocale("ru_RU.UTF-8"), "ru");
    EXPECT_EQ(LanguageFromLocale("de_DE@euro"), "de");
    EXPECT_EQ(LanguageFromLocale("fr"), "fr");
    EXPECT_EQ(LanguageFromLocale("C.UTF-8"), "en");
    EXPECT_EQ(LanguageFromLocale("POSIX"), "en");
    EXPECT_EQ(LanguageFromLocale("../x"), "");
    EXPECT_EQ(LanguageFromLocale(""), "");

    char buffer[kLanguageCapacity];
    oxtest::ScopedEnv all("LC_ALL", ""), messages("LC_MESSAGES", "pl_PL.UTF-8"), lang("LANG", "de_DE.UTF-8");
    ASSERT_TRUE(GetCurrentUserPreferredLanguage(buffer, sizeof(buffer)));
    EXPECT_STREQ(buffer, "pl") << "LC_MESSAGES comes before LANG, an empty LC_ALL is skipped";
    {
        oxtest::ScopedEnv bad("LC_MESSAGES", "_broken");
        EXPECT_FALSE(GetCurrentUserPreferredLanguage(buffer, sizeof(buffer)));
        EXPECT_STREQ(buffer, "");
    }
    oxtest::ScopedEnv none1("LC_MESSAGES", nullptr), none2("LANG", nullptr);
    ASSERT_TRUE(GetCurrentUserPreferredLanguage(buffer, sizeof(buffer)));
    EXPECT_STREQ(buffer, "en") << "with nothing set the C locale applies";
}

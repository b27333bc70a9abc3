#include "core/Declaration.h"
#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "support/TestSupport.h"

using namespace ox::core;

namespace {

// Records the order in which declarations load; ids starting with "bad" fail.
struct RecordingManager : CResourceManager<int, FontDeclaration> {
    std::vector<std::string> order;
    bool Load(const FontDeclaration& declaration, int& item) override
    {
        order.push_back(declaration.m_Id->str());
        item = static_cast<int>(order.size());
        return declaration.m_Id->view().substr(0, 3) != "bad";
    }
    bool Reload(const FontDeclaration& declaration, int& item, bool) override
    {
        order.push_back("re:" + declaration.m_Id->str());
        item += 100;
        return true;
    }
};

const char* kFonts = R"(<?xml version="1.0"?>
<fonts>
  <font id="outer" image="tex_outer" file="fonts/outer.xml" color="4278190335"/>
  <group id="ui" flags="7">
    <FONT id="inner" file="fonts/inner.xml"/>
    <group id="deep"><font id="deepest"/><font id="bad_one"/></group>
  </group>
  <group id="other"><font id="inner" file="fonts/duplicate.xml"/></group>
</fonts>
)";

} // namespace

TEST(ResourceDeclarations, GroupsLoadDeepestFirstAndTheFirstIdWins)
{
    oxtest::LogCapture log;
    CResourceDeclarations declarations;
    declarations.LoadFromMemory(kFonts, strlen(kFonts), "properties/fonts.xml", nullptr);

    ASSERT_EQ(declarations.m_Declarations.size(), 1u);
    const FontDeclaration& outer = declarations.m_Declarations[0];
    EXPECT_EQ(outer.file, "fonts/outer.xml");
    EXPECT_EQ(outer.image->view(), "tex_outer");
    EXPECT_EQ(outer.color.Alpha, 255);
    EXPECT_EQ(outer.color.Blue, 255);
    ResourceGroup* ui = declarations.FindGroup("ui");
    ASSERT_NE(ui, nullptr);
    EXPECT_EQ(ui->m_Flags, 0u) << "flags are accepted and ignored";
    EXPECT_EQ(ui->m_Declarations[0].file, "fonts/inner.xml") << "upper-case element names count";
    ASSERT_NE(declarations.FindGroup("other"), nullptr);
    EXPECT_TRUE(declarations.FindGroup("other")->m_Declarations.empty()) << "the duplicate is removed";
    auto entries = log.Entries();
    EXPECT_EQ(std::count(entries.begin(), entries.end(), "resdecl|2|Resource declaration \"inner\" already loaded."), 1);

    RecordingManager manager;
    unsigned counter = 0;
    manager.LoadGroup(declarations, &counter);
    EXPECT_EQ(manager.order, (std::vector<std::string>{"deepest", "bad_one", "inner", "outer"}));
    EXPECT_EQ(counter, 4u) << "a failed item still counts";
    EXPECT_EQ(manager.GetItem("bad_one"), nullptr);
    int* inner = manager.GetItem("inner");
    ASSERT_NE(inner, nullptr);
    EXPECT_EQ(manager.GetItemId(inner)->view(), "inner");
    int foreign = 0;
    EXPECT_EQ(manager.GetItemId(&foreign), nullptr);

    manager.ReloadGroup(declarations, true, nullptr);
    EXPECT_EQ(manager.GetItem("inner"), inner) << "reloaded in place";
    EXPECT_EQ(*inner, 103);
}

TEST(ResourceDeclarations, MistakesInTheFileAreLoggedAndSkipped)
{
    const std::string tooLong(88, 'x'), longest(87, 'y');
    const std::string xml = "<?xml version=\"1.0\"?>\n<root>\n<font id=\"a\"/>\n"
                            "<sprite id=\"s\"><font id=\"in_sprite\"/></sprite>\n"
                            "<font id=\"b\"><font id=\"nested\"/><group id=\"g\"/></font>\n"
                            "<font id=\"" + tooLong + "\" image=\"t\"/>\n"
                            "<font id=\"c\" image=\"" + tooLong + "\"/>\n"
                            "<group id=\"" + tooLong + "\"><font id=\"d\"/><group id=\"h\"/></group>\n"
                            "<font id=\"d\"/><font id=\"" + longest + "\"/></root>";
    oxtest::LogCapture log;
    oxtest::AssertCapture asserts;
    CResourceDeclarations declarations;
    declarations.LoadFromMemory(xml.data(), xml.size(), "extra.xml", "extra");
    EXPECT_EQ(asserts.Count(), 0u);

    ResourceGroup* extra = declarations.FindGroup("extra");
    ASSERT_NE(extra, nullptr);
    EXPECT_TRUE(extra->m_Groups.empty()) << "neither the group in a font nor the one with a long id";
    std::vector<std::string> ids;
    for (const FontDeclaration& declaration : extra->m_Declarations)
        ids.push_back(declaration.m_Id->str());
    EXPECT_EQ(ids, (std::vector<std::string> {"a", "b", "d", longest})) << "a skipped \"d\" is no duplicate";
    EXPECT_TRUE(log.Contains("extra.xml line 4: unknown element \"sprite\" skipped with its content"));
    EXPECT_TRUE(log.Contains("extra.xml line 5: element \"font\" inside font \"b\" skipped"));
    EXPECT_TRUE(log.Contains("extra.xml line 5: element \"group\" inside font \"b\" skipped"));
    EXPECT_TRUE(log.Contains("extra.xml line 6: font skipped: its id \"" + tooLong.substr(0, 40)));
    EXPECT_TRUE(log.Contains("extra.xml line 7: font skipped: its image \"" + tooLong.substr(0, 40)));
    EXPECT_TRUE(log.Contains("extra.xml line 8: group skipped: its id \"" + tooLong.substr(0, 40)));
    EXPECT_FALSE(log.Contains("already loaded"));
    EXPECT_FALSE(log.Contains("in_sprite"));

    // Look-ups with names no identifier holds find nothing.
    RecordingManager manager;
    manager.LoadGroup(declarations, nullptr);
    EXPECT_EQ(manager.GetItem(tooLong.c_str()), nullptr);
    EXPECT_EQ(declarations.FindGroup(tooLong.c_str()), nullptr);
    EXPECT_NE(manager.GetItem(longest.c_str()), nullptr);
    declarations.LoadFromMemory(xml.data(), xml.size(), "extra.xml", tooLong.c_str());
    EXPECT_EQ(declarations.m_Groups.size(), 1u);
    EXPECT_EQ(asserts.Count(), 0u);
}

TEST(ResourceDeclarations, MissingFilesDeclareNothing)
{
    CResourceDeclarations declarations;
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    declarations.Load("properties/missing.xml", nullptr);
    EXPECT_TRUE(declarations.m_Declarations.empty());
}

TEST(Settings, LoadXmlReadsThroughThePackAndLocalTextExpands)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    dir.Write("game.xml", "<?xml version=\"1.0\"?><settings company=\"$$1 Co\" version=\"105\"/>");
    oxtest::LogCapture log;
    CSettings settings;
    ASSERT_TRUE(settings.LoadXml("game.xml"));
    const CSettingsGroup& group = settings.GetChild("settings");
    EXPECT_EQ(ReadInt(group, "version"), 105);
    EXPECT_EQ(oxtest::Narrow(ReadLocalText(group, "company")), "$1 Co");
    EXPECT_FALSE(settings.LoadXml("absent.xml"));
    EXPECT_TRUE(log.Contains("CSettings::LoadXml failed on file absent.xml"));
}

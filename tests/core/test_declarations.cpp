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

TEST(ResourceDeclarations, NamedTargetGroupUnknownElementsAndMissingFiles)
{
    CResourceDeclarations declarations;
    const char* xml = "<?xml version=\"1.0\"?><root><font id=\"a\"/><sprite id=\"x\"/></root>";
    EXPECT_CONTRACT_FAILURE(declarations.LoadFromMemory(xml, strlen(xml), "extra.xml", "extra"),
                            "!\"unknown resource declaration element\"");
    ResourceGroup* extra = declarations.FindGroup("extra");
    ASSERT_NE(extra, nullptr);
    EXPECT_EQ(extra->m_Declarations.size(), 1u);

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

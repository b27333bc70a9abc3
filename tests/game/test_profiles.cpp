// Player profiles: saves.xml as written and read back, the current profile across a restart,
// the list's edge cases and damaged or hand-edited files.
#include "game/GameOptions.h"
#include "game/Profile.h"
#include "misc/Unicode.h"
#include "support/TestSupport.h"

#include <set>

using namespace k17;
using ox::wstring;

namespace {

const std::string kHead = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";

struct Profiles : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    wstring folder = ox::misc::Utf8ToWide(dir.Path().string());

    std::unique_ptr<CProfileManager> Manager(CGameOptions* options = nullptr)
    {
        auto manager = std::make_unique<CProfileManager>(options);
        manager->SetSavesFolder(folder);
        manager->Load();
        return manager;
    }
    std::string SavesXml() const { return oxtest::ReadFile(dir / "saves.xml"); }
};

const char* const kTwoProfiles =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
    "<Profiles current_profile_name=\"B&amp;o\" current_profile_name=\"b0b\" >\n"
    "<profile name=\"Ann\" guid=\"a1\" game_guid=\"\" step=\"\" points_count=\"0\" hints_count=\"0\" "
    "thermometer_points=\"0\" alpha_thermometer_points=\"0\" step_type=\"-1\" level_state=\"0\" "
    "hints_use_count=\"0\" hints_use_flag=\"0\" />\n"
    "<profile name=\"B&amp;o\" guid=\"b0b\" game_guid=\"g7\" step=\"level1\" points_count=\"12\" hints_count=\"3\" "
    "thermometer_points=\"4\" alpha_thermometer_points=\"5\" step_type=\"0\" level_state=\"1\" "
    "hints_use_count=\"6\" hints_use_flag=\"1\" />\n"
    "</Profiles>\n";

} // namespace

TEST_F(Profiles, SavesXmlLayoutRoundTripsByteForByte)
{
    dir.Write("saves.xml", kTwoProfiles);
    auto manager = Manager();
    ASSERT_EQ(manager->EnumProfiles(), 2u);
    ASSERT_NE(manager->GetCurrentProfile(), nullptr);
    EXPECT_EQ(manager->GetCurrentProfile()->GetGUID(), "b0b");
    EXPECT_EQ(manager->GetCurrentProfile()->GetHintsUseCount(), 6);
    EXPECT_EQ(manager->GetCurrentProfile()->GetSaveFileName(), ox::misc::Utf8ToWide((dir / "b0b.sav").string()));
    std::filesystem::remove(dir / "saves.xml");
    ASSERT_TRUE(manager->Save());
    EXPECT_EQ(SavesXml(), kTwoProfiles);
}

TEST_F(Profiles, CurrentProfileSurvivesARestartAndTellsTheOptions)
{
    std::string guid;
    {
        auto manager = Manager();
        manager->CreateProfile(u"Ann", false);
        CProfile* bo = manager->CreateProfile(u"Бо", true);
        bo->SetStep("level2");
        bo->SetLevelState(LevelStateTypeInGame);
        guid = bo->GetGUID();
        ASSERT_TRUE(manager->Save());
    }
    CGameOptions options;
    std::vector<std::string> volumes;
    options.SetTarget({nullptr, nullptr, [&](const char* group, float) { volumes.push_back(group); }});
    auto manager = Manager(&options);
    ASSERT_NE(manager->GetCurrentProfile(), nullptr);
    EXPECT_EQ(manager->GetCurrentProfile()->GetName(), u"Бо");
    EXPECT_EQ(manager->GetCurrentProfile()->GetGUID(), guid);
    EXPECT_EQ(manager->GetCurrentProfile()->GetStep(), "level2");
    EXPECT_EQ(manager->GetCurrentProfile()->GetLevelState(), LevelStateTypeInGame);
    EXPECT_EQ(volumes, (std::vector<std::string>{"music", "sound", "voice"}));
}

TEST_F(Profiles, ListEdgeCases)
{
    auto manager = Manager();
    CProfile* ann = manager->CreateProfile(u"Ann", true);
    manager->CreateProfile(u"ann", false);
    EXPECT_EQ(manager->EnumProfiles(), 2u) << "names differing by case are two profiles";
    EXPECT_TRUE(CProfileManager::CompareWithoutCase(u"ann", u"ANN"));
    EXPECT_TRUE(CProfileManager::CompareWithoutCase(u"Ёлка Žž", u"ёЛКА žŽ"));
    EXPECT_FALSE(CProfileManager::CompareWithoutCase(u"Ann", u"Anna"));
    EXPECT_EQ(manager->GetProfile(manager->EnumProfiles()), nullptr);
    EXPECT_EQ(manager->GetProfile(u"ANN"), nullptr) << "look-ups compare exactly";

    wstring file = ann->GetSaveFileName();
    manager->Rename(u"Ann", u"Anne");
    EXPECT_EQ(ann->GetSaveFileName(), file) << "renaming keeps the save file";
    manager->SetCurrentProfile(u"nobody");
    EXPECT_EQ(manager->GetCurrentProfile(), ann);
    manager->DeleteProfile(u"Anne");
    EXPECT_EQ(manager->GetCurrentProfile(), nullptr);
    EXPECT_EQ(manager->EnumProfiles(), 1u);

    ASSERT_TRUE(manager->Save());
    EXPECT_NE(SavesXml().find("current_profile_name=\"\" current_profile_name=\"\""), std::string::npos);
    EXPECT_EQ(Manager()->GetCurrentProfile(), nullptr);
}

TEST_F(Profiles, GuidsAreFreshHexadecimalText)
{
    std::set<std::string> seen;
    for (int i = 0; i < 50; ++i) {
        std::string guid = CreateGUIDString();
        EXPECT_EQ(guid.find_first_not_of("0123456789abcdef"), std::string::npos) << guid;
        EXPECT_GE(guid.size(), 11u);
        EXPECT_LE(guid.size(), 32u);
        seen.insert(guid);
    }
    EXPECT_EQ(seen.size(), 50u);
}

TEST_F(Profiles, HandEditedFileKeepsWhatThePlayerHad)
{
    dir.Write("saves.xml", kHead + "<Profiles current_profile_name=\"Gone\">"
                           "<profile name=\"Ann\" guid=\"\" points_count=\"many\" hints_count=\"7\" colour=\"red\"/>"
                           "<profile name=\"Ann\" guid=\"../../etc/x\" step=\"level3\"/>"
                           "<profile guid=\"nameless\"/>"
                           "<profile name=\"Cy\" guid=\"c1\"/><profile name=\"Di\" guid=\"c1\"/>"
                           "</Profiles>");
    auto manager = Manager();
    ASSERT_EQ(manager->EnumProfiles(), 4u);
    CProfile* ann = manager->GetProfile(u"Ann");
    EXPECT_FALSE(ann->GetGUID().empty()) << "an empty guid keeps a fresh one";
    EXPECT_EQ(ann->GetPointsCount(), 0);
    EXPECT_EQ(ann->GetHintsCount(), 7);
    CProfile* second = manager->GetProfile(u"Ann (2)");
    ASSERT_NE(second, nullptr);
    EXPECT_EQ(second->GetStep(), "level3");
    EXPECT_EQ(second->GetGUID().find('/'), std::string::npos);
    EXPECT_NE(manager->GetProfile(u"Di")->GetGUID(), "c1") << "two profiles never share a save file";
    EXPECT_EQ(manager->GetCurrentProfile(), nullptr);
    EXPECT_TRUE(log.Contains("saves.xml: <profile> attribute points_count=\"many\" is not a number"));
    EXPECT_TRUE(log.Contains("the current profile is not in the list"));
    EXPECT_TRUE(log.Contains("saves.xml: <profile> has an unknown attribute colour, ignored"));
}

TEST_F(Profiles, DamagedFileIsKeptAsideAndWhatReadsIsUsed)
{
    std::string cut = std::string(kTwoProfiles).substr(0, std::string(kTwoProfiles).find("<profile name=\"B"));
    dir.Write("saves.xml", cut);
    auto manager = Manager();
    EXPECT_EQ(manager->EnumProfiles(), 1u);
    EXPECT_EQ(oxtest::ReadFile(dir / "saves.xml.broken"), cut);
    EXPECT_TRUE(log.Contains("saves.xml is damaged"));

    dir.Write("saves.xml", "");
    EXPECT_EQ(Manager()->EnumProfiles(), 0u);
    EXPECT_TRUE(log.Contains("saves.xml is damaged (empty)"));
}

TEST_F(Profiles, UnwritableFolderIsLoggedShownOnceAndTheGameGoesOn)
{
    oxtest::MessageCapture boxes;
    dir.Write("file_not_folder", "x");
    auto manager = std::make_unique<CProfileManager>();
    manager->SetSavesFolder(ox::misc::Utf8ToWide((dir / "file_not_folder").string()));
    manager->CreateProfile(u"Ann", true);
    EXPECT_FALSE(manager->Save());
    EXPECT_FALSE(manager->Save());
    EXPECT_TRUE(log.Contains("cannot save"));
    EXPECT_LE(boxes.Boxes().size(), 1u);
    EXPECT_EQ(manager->EnumProfiles(), 1u);
}

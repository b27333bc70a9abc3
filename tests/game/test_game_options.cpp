// Game options: defaults per new player, trying and taking back changes, what reaches the
// screen and the audio groups, options.xml as written and read, hand-edited files.
#include "core/Settings.h"
#include "game/GameOptions.h"
#include "misc/Unicode.h"
#include "sound/AudioManager.h"
#include "support/TestSupport.h"

using namespace k17;

namespace {

const std::string kHead = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";

struct Options : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    ox::core::CSettings constants;
    std::vector<std::string> calls;
    // What the application reports after a change: a refused full screen stays a window.
    bool fullScreenWorks = true;
    bool isFullScreen = false;

    void SetUp() override
    {
        const std::string xml = kHead + "<Constants><default_options>"
                          "<option id=\"full_screen\" value=\"false\"/><option id=\"sound_volume\" value=\"70\"/>"
                          "<option id=\"music_volume\" value=\"60\"/><option id=\"voice_volume\" value=\"50\"/>"
                          "<option id=\"brightness\" value=\"40\"/><option id=\"dificulty_level\" value=\"0\"/>"
                          "</default_options></Constants>";
        ASSERT_TRUE(constants.LoadXmlFromMemory(xml.data(), xml.size(), "constants.xml"));
    }

    std::unique_ptr<CGameOptions> Make()
    {
        auto options = std::make_unique<CGameOptions>();
        options->SetDefaults(constants.GetChild("Constants"));
        options->SetTarget({[this](bool fs, bool bpp, unsigned w, unsigned h) {
                                calls.push_back("screen " + std::to_string(fs) + std::to_string(bpp) + " " +
                                                std::to_string(w) + "x" + std::to_string(h));
                                isFullScreen = fs && fullScreenWorks;
                                return true;
                            },
                            [this] { return isFullScreen; },
                            [this](const char* group, float volume) {
                                calls.push_back(std::string(group) + " " + std::to_string(static_cast<int>(volume)));
                            }});
        options->SetFolder(ox::misc::Utf8ToWide(dir.Path().string()));
        options->Load();
        return options;
    }
};

} // namespace

TEST_F(Options, NewPlayerStartsFromTheDefaultsAndTheyReachScreenAndAudio)
{
    auto options = Make();
    options->SetCurrentProfile("ann");
    options->SetMusicVolume(10);
    options->UpdateLocalSettings();
    calls.clear();
    options->SetCurrentProfile("bob");
    EXPECT_EQ(calls, (std::vector<std::string>{"screen 00 1024x768", "music 60", "sound 70", "voice 50"}));
    options->SetCurrentProfile("ann");
    EXPECT_EQ(options->GetMusicVolume(), 10.0f);

    calls.clear();
    options->SetFullScreenMode(true);
    options->ApplyOptionsChanges();
    EXPECT_EQ(calls, (std::vector<std::string>{"screen 10 0x0"}));
    EXPECT_TRUE(options->GetFullScreenMode());
}

TEST_F(Options, RestoreTakesBackWhatWasNotSaved)
{
    auto options = Make();
    options->SetCurrentProfile("ann");
    options->SetSoundVolume(5);
    options->SetFullScreenMode(true);
    options->RestoreResolution();
    EXPECT_FALSE(options->GetFullScreenMode());
    EXPECT_EQ(options->GetSoundVolume(), 5.0f) << "RestoreResolution keeps a changed volume";
    options->RestoreOptions();
    EXPECT_EQ(options->GetSoundVolume(), 70.0f);

    options->SetSoundVolume(20);
    options->Save();
    options->SetSoundVolume(30);
    options->RestoreOptions();
    EXPECT_EQ(options->GetSoundVolume(), 20.0f) << "Save commits";
}

TEST_F(Options, SavedFileHoldsRefusedFullScreenAsOffAndDifficultyPerPlayer)
{
    fullScreenWorks = false;
    {
        auto options = Make();
        options->SetCurrentProfile("ann");
        options->SetCurrentProfile("bob");
        options->SetDificultyLevel(CGameOptions::DificultyLevelHard);
        options->SetBrightness(12.5f);
        options->UpdateLocalSettings();
        options->SetFullScreenMode(true);
        options->ApplyOptionsChanges();
        ASSERT_TRUE(options->Save());
    }
    EXPECT_EQ(oxtest::ReadFile(dir / "options.xml"),
              "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
              "<Options >\n<Common_Options >\n<option id=\"full_screen\" value=\"false\" />\n</Common_Options>\n"
              "<Profiles_Options >\n"
              "<profile_options guid=\"ann\" >\n<option id=\"sound_volume\" value=\"70\" />\n"
              "<option id=\"music_volume\" value=\"60\" />\n<option id=\"voice_volume\" value=\"50\" />\n"
              "<option id=\"brightness\" value=\"40\" />\n<option id=\"dificulty_level\" value=\"0\" />\n"
              "</profile_options>\n"
              "<profile_options guid=\"bob\" >\n<option id=\"sound_volume\" value=\"70\" />\n"
              "<option id=\"music_volume\" value=\"60\" />\n<option id=\"voice_volume\" value=\"50\" />\n"
              "<option id=\"brightness\" value=\"12.500\" />\n<option id=\"dificulty_level\" value=\"1\" />\n"
              "</profile_options>\n</Profiles_Options>\n</Options>\n");
    auto options = Make();
    options->SetCurrentProfile("bob");
    EXPECT_EQ(options->GetDificultyLevel(), 1);
    options->SetCurrentProfile("ann");
    EXPECT_EQ(options->GetDificultyLevel(), 0);
}

TEST_F(Options, HandEditedFileGivesDefaultsForWhatIsWrong)
{
    dir.Write("options.xml", kHead + "<Options><Common_Options><option id=\"full_screen\" value=\"yes\"/></Common_Options>"
                             "<Profiles_Options><profile_options guid=\"ann\">"
                             "<option id=\"sound_volume\" value=\"loud\"/><option id=\"music_volume\" value=\"500\"/>"
                             "<option id=\"voice_volume\" value=\"-3\"/><option id=\"dificulty_level\" value=\"7\"/>"
                             "<option id=\"extra\" value=\"1\"/></profile_options>"
                             "<profile_options><option id=\"sound_volume\" value=\"1\"/></profile_options>"
                             "</Profiles_Options></Options>");
    auto options = Make();
    options->SetCurrentProfile("ann");
    EXPECT_FALSE(options->GetFullScreenMode());
    EXPECT_EQ(options->GetSoundVolume(), 70.0f);
    EXPECT_EQ(options->GetMusicVolume(), 100.0f);
    EXPECT_EQ(options->GetVoiceVolume(), 0.0f);
    EXPECT_EQ(options->GetDificultyLevel(), 0);
    EXPECT_TRUE(log.Contains("options.xml: <option> attribute value=\"loud\" is not a number"));
    EXPECT_TRUE(log.Contains("profile_options without a guid"));
}

TEST_F(Options, DefaultTargetSetsTheAudioManagersGroups)
{
    CGameOptions options;
    options.SetDefaults(constants.GetChild("Constants"));
    options.SetCurrentProfile("ann");
    ox::sound::CAudioManager& audio = ox::sound::CAudioManager::Instance();
    EXPECT_EQ(audio.GetGroupVolume("music"), 60.0f);
    EXPECT_EQ(audio.GetGroupVolume("sound"), 70.0f);
    EXPECT_EQ(audio.GetGroupVolume("voice"), 50.0f);
}

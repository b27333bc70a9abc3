// Quest data: quest.xml compiled to the block, levels built from it against hand-checked
// fields, the pack's dump used in place, damaged dumps, and the full and brief XML forms.
#include "core/Settings.h"
#include "misc/GamePack.h"
#include "misc/XmlWriter.h"
#include "quest/Area.h"
#include "quest/ClipObject.h"
#include "quest/ImageObject.h"
#include "quest/Quest.h"
#include "quest/QuestData.h"
#include "quest/SceneGroup.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace qe;
namespace fs = std::filesystem;

namespace {

// Two levels (the second repeats the first id), a group with two states, a clip, an area,
// scripts of 3, 4 and 5 bytes, an object without a colour.
const char* kQuestXml = R"xml(<?xml version="1.0"?>
<Quest>
  <level id="level1" s1="a=1" s2="b=22" sound1="box.ogg" sound2="open.ogg">
    <scene id="main" size="1024 600" offset="0 0" flags="1" script="c=333">
      <objects>
        <object type="image" id="bg" object_flags="1" hint="" editor_flags="1" s1="" offset="512 300" angle="0" size="1024 600" color="-1" image_id="holed"/>
        <object type="image" id="key" object_flags="0" hint="$101" s1="take(self) return" offset="10 20" angle="1.5" size="30 40" image_id="holed"/>
        <group id="drawer" object_flags="16" hint="$102" s1="self.SetCurrent('open')">
          <object type="image" id="closed" object_flags="0" offset="1 2" size="3 4" color="-16711936" image_id="holed"/>
          <object type="image" id="open" object_flags="2" offset="5 6" size="7 8" color="-1" image_id="missing_texture"/>
        </group>
        <object type="clip" id="spinner" object_flags="8" offset="100 110" size="50 60" color="-1" clip_id="known" use_alpha="true"/>
        <object type="sprite" id="odd"/>
      </objects>
      <areas>
        <area id="door" object_flags="0" s1="open_door()">
          <point offset="0 0"/><point offset="10 0"/><point offset="10 10"/>
        </area>
      </areas>
    </scene>
    <scene id="closeup" size="400 300" offset="300 150" flags="2"/>
  </level>
  <level id="level2"/>
  <level id="level1" s1="second"/>
</Quest>)xml";

struct QuestData : ::testing::Test {
    ox::graphics::CSurface surface {8, 8};
    ox::graphics::CTexture texture {&surface};
    oxtest::LogCapture log;

    void SetUp() override
    {
        ox::graphics::CImage::SetTextureLookup(
            [this](const char* id) { return strcmp(id, "holed") == 0 ? &texture : nullptr; });
    }
    void TearDown() override { ox::graphics::CImage::SetTextureLookup(nullptr); }

    static std::vector<uint8_t> Compile(const std::string& xml)
    {
        ox::core::CSettings settings;
        EXPECT_TRUE(settings.LoadXmlFromMemory(xml.data(), xml.size(), "quest.xml"));
        return dump::Compile(settings.GetChild("Quest"), "quest.xml");
    }
    static LevelPtrT Build(const std::vector<uint8_t>& block, const char* id)
    {
        return LevelPtrT(dump::BuildLevel(block.data(), block.size(), id));
    }
};

template <class T>
T At(const std::vector<uint8_t>& block, size_t offset)
{
    T value;
    memcpy(&value, block.data() + offset, sizeof(T));
    return value;
}

std::string Ids(const CScene::ObjectsListT& list)
{
    std::string ids;
    for (const auto& object : list)
        ids += object->GetIdRef() + " ";
    return ids;
}

} // namespace

TEST_F(QuestData, TheBlockHasTheRecordLayout)
{
    const std::vector<uint8_t> block = Compile(kQuestXml);
    EXPECT_EQ(At<uint32_t>(block, 0), dump::kMagic);
    // The first level: "a=1" stores 4 bytes, "b=22" stores 8 (the text and four zeros).
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(block.data() + 4 + 8)), "level1");
    EXPECT_EQ(At<uint16_t>(block, 4 + 96), 4);
    EXPECT_EQ(At<uint16_t>(block, 4 + 98), 8);
    EXPECT_EQ(At<uint32_t>(block, 4 + 100), 2u) << "scenes";
    EXPECT_EQ(0, memcmp(block.data() + 4 + 112, "b=22\0\0\0\0", 8));
    const uint32_t levelSize = At<uint32_t>(block, 4 + 104);
    // The first scene: "c=333" stores 8; the odd object is left out of the count.
    const size_t scene = 4 + 108 + 12;
    EXPECT_EQ(At<uint32_t>(block, scene + 96), 1u);
    EXPECT_EQ(At<float>(block, scene + 100), 1024.0f);
    EXPECT_EQ(At<uint32_t>(block, scene + 116), 8u);
    EXPECT_EQ(At<uint16_t>(block, scene + 124), 4) << "bg, key, drawer, spinner";
    EXPECT_EQ(At<uint16_t>(block, scene + 126), 1);
    const uint32_t sceneSize = At<uint32_t>(block, scene + 120);
    // The closing scene is a bare header with no strings; the level ends behind it.
    EXPECT_EQ(levelSize, 108 + 12 + sceneSize + 128);
    // The second level follows at the stored size, the third behind it.
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(block.data() + 4 + levelSize + 8)), "level2");
    EXPECT_EQ(block.size(), 4 + levelSize + 108 + (108 + 8));
    EXPECT_TRUE(log.Contains("object 'odd' has the type 'sprite'"));
}

TEST_F(QuestData, XmlToBlockToLevelGivesTheFieldsInFileOrder)
{
    const std::vector<uint8_t> block = Compile(kQuestXml);
    LevelPtrT level = Build(block, "level1");
    ASSERT_TRUE(level);
    EXPECT_EQ(level->GetLuaScript(CLevel::ScriptLevel), "a=1") << "the first of two levels with one id";
    EXPECT_EQ(level->GetLuaScript(CLevel::ScriptStart), "b=22");
    EXPECT_EQ(level->GetSound(CLevel::SoundMovingToABox), "") << "the block holds no sounds";
    ASSERT_EQ(level->EnumScenes(), 2u);
    CScene* main = level->GetSceneById("main");
    ASSERT_TRUE(main);
    EXPECT_EQ(main->GetFlags(), 1u);
    EXPECT_EQ(main->GetScript(), "c=333");
    EXPECT_EQ(main->GetParentLevel(), level.get());
    EXPECT_EQ(Ids(main->Objects()), "bg key drawer spinner ");
    EXPECT_EQ(Ids(main->Childs()), "bg key closed open spinner ");

    auto* key = static_cast<CImageObject*>(main->IsContentObject("key"));
    EXPECT_EQ(key->GetHint(), "$101");
    EXPECT_EQ(key->GetLuaScript(CBaseSceneObject::ScriptMouseClick), "take(self) return");
    EXPECT_EQ(key->GetPos(), FloatVector(10, 20));
    EXPECT_EQ(key->GetSize(), FloatVector(30, 40));
    EXPECT_EQ(key->GetAngle(), 1.5f);
    EXPECT_EQ(key->GetTextureId(), "holed");
    EXPECT_EQ(key->GetNativeSize(), FloatVector(8, 8)) << "the texture is bound";
    EXPECT_EQ(key->GetColor().GetARGB(), 0u) << "no colour compiles to transparent black";
    EXPECT_EQ(key->GetFlags(), 0u) << "editor flags are not in the block";

    auto* drawer = static_cast<CSceneGroup*>(main->IsContentObject("drawer"));
    ASSERT_EQ(drawer->EnumChilds(), 2u);
    EXPECT_EQ(drawer->GetObjectFlags(), 16u);
    EXPECT_EQ(drawer->Childs().front()->GetParentGroup(), drawer);
    EXPECT_EQ(drawer->Childs().front()->GetColor().GetARGB(), 0xFF00FF00u);
    EXPECT_TRUE(drawer->Childs().back()->ReadObjectFlag(CBaseSceneObject::ObjectFlagHidden));
    EXPECT_TRUE(log.Contains("missing_texture")) << "a missing texture is logged";

    auto* spinner = static_cast<CClipObject*>(main->IsContentObject("spinner"));
    EXPECT_TRUE(spinner->IsUsingAlpha());
    EXPECT_EQ(spinner->GetClipId(), "known");
    auto* door = static_cast<CArea*>(main->IsContentArea("door"));
    ASSERT_EQ(door->EnumPoints(), 3u);
    EXPECT_EQ(door->Points()[1]->GetPos(), FloatVector(10, 0));
    EXPECT_EQ(door->GetLuaScript(CBaseSceneObject::ScriptMouseClick), "open_door()");
    EXPECT_EQ(level->GetSceneById("closeup")->GetOffset(), FloatVector(300, 150));

    EXPECT_TRUE(Build(block, "level2"));
    EXPECT_FALSE(Build(block, "nowhere"));
    CQuestData none;
    EXPECT_EQ(none.CreateLevel("level1"), nullptr) << "no block";
}

TEST_F(QuestData, XmlLoadMatchesTheBuiltLevelButForColoursSoundsAndEditorFlags)
{
    oxtest::TempDir dir;
    const fs::path path = dir.Write("quest.xml", kQuestXml);
    QuestPtrT quest(new CQuest());
    ASSERT_TRUE(quest->Load(path.string()));
    ASSERT_EQ(quest->EnumLevels(), 3u);
    CLevel* loaded = quest->GetLevelById("level1");
    LevelPtrT built = Build(Compile(kQuestXml), "level1");
    EXPECT_EQ(loaded->GetSound(CLevel::SoundMovingToABox), "box.ogg");
    CScene* a = loaded->GetSceneById("main");
    CScene* b = built->GetSceneById("main");
    EXPECT_EQ(Ids(a->Childs()), Ids(b->Childs()));
    EXPECT_EQ(Ids(a->Areas()), Ids(b->Areas()));
    auto ia = a->Childs().begin();
    for (auto ib = b->Childs().begin(); ib != b->Childs().end(); ++ia, ++ib) {
        SCOPED_TRACE((*ia)->GetIdRef());
        EXPECT_EQ((*ia)->GetObjectFlags(), (*ib)->GetObjectFlags());
        EXPECT_EQ((*ia)->GetHint(), (*ib)->GetHint());
        EXPECT_EQ((*ia)->GetPos(), (*ib)->GetPos());
        EXPECT_EQ((*ia)->GetLuaScript(0), (*ib)->GetLuaScript(0));
    }
    EXPECT_EQ(a->IsContentObject("key")->GetColor().GetARGB(), 0xFFFFFFFFu) << "the XML load takes white";
    EXPECT_EQ(a->IsContentObject("bg")->GetFlags(), 0u) << "FlagSelected is cleared on loading";

    // Saved and loaded again, the quest is the same file.
    const fs::path again = dir / "again.xml";
    quest->Save(again.string());
    QuestPtrT reloaded(new CQuest());
    ASSERT_TRUE(reloaded->Load(again.string()));
    const fs::path third = dir / "third.xml";
    reloaded->Save(third.string());
    EXPECT_EQ(oxtest::ReadFile(again), oxtest::ReadFile(third));
    EXPECT_EQ(Compile(oxtest::ReadFile(again)), Compile(oxtest::ReadFile(third)));
}

TEST_F(QuestData, BriefSaveHoldsFlagsHintsAndNonDefaultColoursOnly)
{
    LevelPtrT level = Build(Compile(kQuestXml), "level1");
    CScene* main = level->GetSceneById("main");
    main->IsContentObject("bg")->SetColor(Color(0xFFFFFFFFu));
    main->IsContentObject("key")->RaiseObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    boost::intrusive_ptr<ox::misc::CXmlWriter> writer(new ox::misc::CXmlWriter(true));
    {
        ox::misc::CXmlElement root(*writer, "save");
        level->Save(root, true);
    }
    void* data = nullptr;
    unsigned size = 0;
    ASSERT_TRUE(writer->GetBuffer(&data, &size));
    const std::string text(static_cast<char*>(data), size);
    free(data);
    EXPECT_NE(text.find(R"(<object object_flags="1" id="bg" hint="" type="image" />)"), std::string::npos) << text;
    EXPECT_NE(text.find(R"(<object object_flags="4" id="key" hint="$101" type="image" color="0" />)"),
              std::string::npos) << text;
    EXPECT_NE(text.find(R"(<area object_flags="0" id="door" hint="" />)"), std::string::npos) << text;
    for (const char* absent : {"s1=", "offset=\"10", "image_id", "sound", "editor_flags", "<point"})
        EXPECT_EQ(text.find(absent), std::string::npos) << absent << "\n" << text;

    // Loaded briefly into a fresh level, the state comes back; the pictures are not bound.
    ox::core::CSettings settings;
    ASSERT_TRUE(settings.LoadXmlFromMemory(text.data(), text.size(), "save"));
    LevelPtrT restored(new CLevel());
    restored->Load(settings.GetChild("save").GetChild("level"), true);
    CScene* scene = restored->GetSceneById("main");
    ASSERT_TRUE(scene);
    EXPECT_TRUE(scene->IsContentObject("key")->ReadObjectFlag(CBaseSceneObject::ObjectFlagRemoved));
    EXPECT_EQ(scene->IsContentObject("key")->GetColor().GetARGB(), 0u);
    EXPECT_EQ(scene->IsContentObject("bg")->GetColor().GetARGB(), 0xFFFFFFFFu);
    EXPECT_EQ(scene->GetScript(), "") << "a brief load reads id and flags of a scene";
    EXPECT_EQ(scene->GetFlags(), 1u);
}

TEST_F(QuestData, ADamagedBlockIsLoggedAndBuildsWhatReads)
{
    const std::vector<uint8_t> block = Compile(kQuestXml);
    // Cut anywhere: never a crash, never more than what lies before the cut.
    for (size_t cut = 0; cut < block.size(); cut += 3) {
        std::vector<uint8_t> part(block.begin(), block.begin() + cut);
        LevelPtrT level = Build(part, "level1");
        if (level && level->EnumScenes() > 0) {
            EXPECT_LE(level->Scenes().front()->EnumObjects(), 4u);
        }
    }
    EXPECT_TRUE(log.Contains("quest data: the level block at byte 4 is damaged"));

    // A damaged object header: the scene keeps what came before it, the next scene is read.
    std::vector<uint8_t> broken = block;
    const size_t scene = 4 + 108 + 12;
    const size_t firstObject = scene + 128 + 8;
    broken[firstObject + dump::kObjectKindAt] = 9;
    LevelPtrT level = Build(broken, "level1");
    ASSERT_TRUE(level);
    EXPECT_EQ(level->GetSceneById("main")->EnumObjects(), 0u);
    EXPECT_TRUE(level->GetSceneById("closeup"));
    EXPECT_TRUE(log.Contains("level 'level1', scene 'main': an object is damaged"));
}

TEST_F(QuestData, ThePackDumpIsUsedInPlaceAndAWrongMagicIsShown)
{
    oxtest::TempDir dir;
    const std::vector<uint8_t> block = Compile(kQuestXml);
    dir.Write("properties/quest.bindump", std::string(block.begin(), block.end()));
    dir.Write("properties/quest.xml", "<?xml version='1.0'?><Quest><level id='only_in_xml'/></Quest>");
    ox::misc::CGamePack pack(ox::misc::GamePackConfig {dir.Path().string(), "none.pack", ""});
    CQuestData data(&pack);
    data.Load();
    EXPECT_FALSE(data.IsOwned());
    EXPECT_EQ(data.GetSize(), block.size());
    EXPECT_EQ(LevelPtrT(data.CreateLevel("only_in_xml")), nullptr) << "the dump wins over the XML";
    EXPECT_TRUE(LevelPtrT(data.CreateLevel("level2")));

    std::vector<uint8_t> wrong = block;
    wrong[0] ^= 1;
    dir.Write("properties/quest.bindump", std::string(wrong.begin(), wrong.end()));
    oxtest::MessageCapture boxes;
    data.Load();
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].caption, "Error");
    EXPECT_EQ(boxes.Boxes()[0].text, "quest.bindump has incompatible version.");
    EXPECT_EQ(data.CreateLevel("level2"), nullptr);

    fs::remove(dir / "properties/quest.bindump");
    data.Load();
    EXPECT_TRUE(data.IsOwned());
    EXPECT_TRUE(LevelPtrT(data.CreateLevel("only_in_xml")));
}

TEST_F(QuestData, AnIdWithAZeroByteCompilesToWhatTheReaderTakes)
{
    using ox::core::CSettingsGroup;
    using ox::core::SettingsGroupPtrT;
    auto element = [](const char* name) { return SettingsGroupPtrT(new CSettingsGroup(*ox::core::InternId(name))); };
    SettingsGroupPtrT quest = element("Quest"), level = element("level"), scene = element("scene");
    level->AddValue(*ox::core::InternId("id"), "level1");
    std::string id = "main";
    id += '\0';
    id += std::string(90, 'x');
    scene->AddValue(*ox::core::InternId("id"), id);
    level->AddChild(scene, scene->GetId());
    quest->AddChild(level, level->GetId());
    const std::vector<uint8_t> block = dump::Compile(*quest, "quest.xml");
    bool intact = false;
    const std::string description = dump::Describe(block.data(), block.size(), &intact);
    EXPECT_TRUE(intact) << description;
    LevelPtrT built = Build(block, "level1");
    ASSERT_TRUE(built);
    EXPECT_TRUE(built->GetSceneById("main")) << "the id ends at its zero byte";
}

// A level's brief state goes into the profile's save file and comes back onto a level fresh
// from the quest data.
#include "game/LevelState.h"
#include "game/Profile.h"
#include "misc/Unicode.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/SceneGroup.h"
#include "support/TestSupport.h"

using namespace qe;

namespace {

BaseSceneObjectPtrT Image(const char* id)
{
    BaseSceneObjectPtrT image(new CImageObject());
    image->SetId(id);
    return image;
}

// level1: scene main with a key and a lamp group of the states off and on.
LevelPtrT MakeLevel()
{
    LevelPtrT level(new CLevel());
    level->SetId("level1");
    ScenePtrT scene(new CScene());
    scene->SetId("main");
    level->InsertScene(scene, nullptr);
    SceneGroupPtrT lamp(new CSceneGroup());
    lamp->SetId("lamp");
    lamp->InsertChild(Image("off"), nullptr);
    lamp->InsertChild(Image("on"), lamp->Childs().front().get());
    scene->InsertObject(Image("key"), nullptr);
    scene->InsertObject(lamp, scene->Objects().front().get());
    scene->UpdateTotalChildList();
    return level;
}

} // namespace

TEST(LevelSave, BriefStateInTheSaveFileRestoresAFreshLevel)
{
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    k17::CProfileManager profiles;
    profiles.SetSavesFolder(ox::misc::Utf8ToWide(dir.Path().string()));
    const ox::wstring save = profiles.CreateProfile(u"Ann", true)->GetSaveFileName();

    LevelPtrT fresh = MakeLevel();
    EXPECT_FALSE(k17::RestoreLevelState(fresh.get(), save)) << "no save yet";

    LevelPtrT played = MakeLevel();
    played->FindObjectById("key", true, true)->SetObjectFlags(CBaseSceneObject::ObjectFlagRemoved);
    played->FindObjectById("off", true, true)->SetObjectFlags(CBaseSceneObject::ObjectFlagHidden);
    played->FindObjectById("on", true, true)->SetHint("$7");
    played->FindObjectById("on", true, true)->SetColor(ox::graphics::Color(0x80FF0000u));
    ASSERT_TRUE(k17::SaveLevelState(played.get(), save));

    ASSERT_TRUE(k17::RestoreLevelState(fresh.get(), save));
    EXPECT_EQ(fresh->FindObjectById("key", true, false), nullptr) << "a taken object stays taken";
    EXPECT_EQ(fresh->FindObjectById("off", true, true)->GetObjectFlags(), uint32_t(CBaseSceneObject::ObjectFlagHidden));
    EXPECT_EQ(fresh->FindObjectById("on", true, true)->GetHint(), "$7");
    EXPECT_EQ(fresh->FindObjectById("on", true, true)->GetColor(), ox::graphics::Color(0x80FF0000u));

    fresh->SetId("level2");
    EXPECT_FALSE(k17::RestoreLevelState(fresh.get(), save));
    EXPECT_TRUE(log.Contains("holds no state of level level2"));
}

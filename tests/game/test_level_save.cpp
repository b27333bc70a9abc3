// A level's brief state goes into the profile's save file and comes back: the pieces a game's
// scripts save and restore a level with.
#include "core/Settings.h"
#include "game/Profile.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "support/TestSupport.h"

using namespace qe;

namespace {

LevelPtrT MakeLevel()
{
    LevelPtrT level(new CLevel());
    level->SetId("level1");
    ScenePtrT scene(new CScene());
    scene->SetId("main");
    level->InsertScene(scene, nullptr);
    for (const char* id : {"key", "lamp"}) {
        BaseSceneObjectPtrT image(new CImageObject());
        image->SetId(id);
        scene->InsertObject(image, scene->Objects().empty() ? nullptr : scene->Objects().back().get());
    }
    scene->UpdateTotalChildList();
    return level;
}

} // namespace

TEST(LevelSave, BriefStateWrittenToTheSaveFileRestoresAFreshLevel)
{
    oxtest::TempDir dir;
    k17::CProfileManager profiles;
    profiles.SetSavesFolder(ox::misc::Utf8ToWide(dir.Path().string()));
    k17::CProfile* player = profiles.CreateProfile(u"Ann", true);

    LevelPtrT played = MakeLevel();
    played->FindObjectById("key", true, true)->SetObjectFlags(CBaseSceneObject::ObjectFlagRemoved);
    played->FindObjectById("lamp", true, true)->SetHint("$7");
    ox::misc::CXmlWriter writer(true);
    {
        ox::misc::CXmlElement root(writer, "save");
        played->Save(root, true);
    }
    writer.SaveToFile(player->GetSaveFileName());

    ox::core::CSettings settings;
    ASSERT_TRUE(settings.LoadXmlDirect(player->GetSaveFileName()));
    LevelPtrT saved(new CLevel());
    saved->Load(settings.GetChild("save").GetChild("level"), true);
    LevelPtrT fresh = MakeLevel();
    for (const char* id : {"key", "lamp"}) {
        const CBaseSceneObject* from = saved->FindObjectById(id, true, true);
        ASSERT_NE(from, nullptr) << id;
        CBaseSceneObject* to = fresh->FindObjectById(id, true, true);
        to->SetObjectFlags(from->GetObjectFlags());
        to->SetHint(from->GetHint());
    }
    EXPECT_EQ(fresh->FindObjectById("key", true, true)->GetObjectFlags(), uint32_t(CBaseSceneObject::ObjectFlagRemoved));
    EXPECT_EQ(fresh->FindObjectById("key", true, false), nullptr);
    EXPECT_EQ(fresh->FindObjectById("lamp", true, true)->GetHint(), "$7");
}

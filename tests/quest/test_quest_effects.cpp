// Fades of scene objects on a clock the test moves, the effects list's order, and the image
// widget that takes the mouse only on its opaque pixels.
#include "core/TextureManager.h"
#include "core/TimeManager.h"
#include "quest/AlphaImageWidget.h"
#include "quest/Effects.h"
#include "quest/SceneObject.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>

using namespace ox;
using qe::CBaseSceneObject;

namespace {

struct QuestEffects : ::testing::Test {
    oxtest::FakeClock clock;
    core::CTimeManager manager {clock.Source()};
    core::CGroupTimer* level = manager.AttachGroupTimer("level", nullptr);
    qe::BaseSceneObjectPtrT object {new qe::CSceneObject()};
    qe::CEffectsList list;

    QuestEffects() { Frame(1000); }
    void Frame(double ms)
    {
        clock.Advance(ms);
        manager.Update();
        list.Update();
    }
    void Fade(bool appear, bool hold, float time)
    {
        list.AddEffect(new qe::CAlphaEffect(object, appear, hold, time, level));
    }
};

struct ParentProbe : gui::CWidget {
    std::vector<std::string> actions;
    void OnChildAction(const std::string& action, gui::CWidget*) override { actions.push_back(action); }
};

} // namespace

TEST_F(QuestEffects, FadesWriteAlphaUntilTheirEndThenNoFade)
{
    Fade(false, false, 400);
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.75f);
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.5f);
    // A clock that stands freezes the fade.
    level->Pause(true);
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.5f);
    level->Pause(false);
    Frame(100);
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.0f);
    EXPECT_EQ(list.Count(), 1u); // t = 400 is not past the time yet
    Frame(1);
    EXPECT_EQ(object->GetAlpha(), CBaseSceneObject::kNoFade);
    EXPECT_EQ(list.Count(), 0u);

    // Held: opaque all along, and no fade at the end as well.
    Fade(true, true, 200);
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 1.0f);
    Frame(100);
    Frame(1); // a frame steps 100 ms at most
    EXPECT_EQ(object->GetAlpha(), CBaseSceneObject::kNoFade);

    // A time of 0.1 or less writes nothing on the way.
    object->SetAlpha(0.3f);
    Fade(true, false, 0.1f);
    list.Update();
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.3f);
    Frame(1);
    EXPECT_EQ(object->GetAlpha(), CBaseSceneObject::kNoFade);
}

TEST_F(QuestEffects, TheNewestEffectRunsFirstSoTheOlderWins)
{
    Fade(true, false, 400);  // older: appear
    Fade(false, false, 400); // newer: disappear, updated first
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.25f);
    list.Clear();
    Frame(100);
    EXPECT_FLOAT_EQ(object->GetAlpha(), 0.25f); // a cleared fade leaves the last value
}

TEST(AlphaImageWidget, TakesTheMouseOnlyOnOpaquePixels)
{
    oxtest::RecordingBackend* backend = nullptr;
    auto renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    core::CTextureManager& textures = core::CTextureManager::Instance();
    graphics::CSurface* surface = textures.CreateSurface(8, 8);
    ASSERT_NE(surface, nullptr);
    surface->CreateBuffer();
    // The left half opaque, the right half transparent.
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 8; ++x)
            surface->GetBuffer()[y * 8 + x] = x < 4 ? 0xFF102030u : 0x00102030u;
    auto texture = std::make_unique<graphics::CTexture>(surface);

    boost::intrusive_ptr<ParentProbe> parent(new ParentProbe());
    boost::intrusive_ptr<qe::CAlphaImageWidget> image(new qe::CAlphaImageWidget());
    EXPECT_FALSE(image->GetFlags() & gui::FlagDisabled);
    parent->AddWidget(image);
    image->SetImage(texture.get());
    image->SetSize(16, 16); // drawn at twice its size

    EXPECT_TRUE(image->OnMouseDown({2, 2}, gui::LeftButton, 0, false));
    EXPECT_TRUE(image->OnMouseUp({7, 15}, gui::LeftButton, 0, false));
    EXPECT_FALSE(image->OnMouseDown({9, 2}, gui::LeftButton, 0, false));
    EXPECT_FALSE(image->OnMouseDown({2, 2}, gui::LeftButton, 0, true)); // not in the broadcast pass
    EXPECT_FALSE(image->OnMouseDown({-1, 2}, gui::LeftButton, 0, false));

    EXPECT_FALSE(image->OnMouseMove({12, 4}, 0, false));
    EXPECT_TRUE(parent->actions.empty());
    EXPECT_TRUE(image->OnMouseMove({3, 4}, 0, false));
    EXPECT_EQ(parent->actions, std::vector<std::string> {"mouse_move"});
    parent.reset();
    image.reset();
    texture.reset();
    textures.RemoveUnusedSurfaces();
}

// The game's window effects on a clock the test moves: the scale about the centre after the
// shift, the colour and the darkening, the one-shot effects scripts use, and what a missing
// effects description leaves.
#include "core/Settings.h"
#include "game/GameClock.h"
#include "game/WindowEffects.h"
#include "gui/Widget.h"

#include <gtest/gtest.h>

#include <cstring>

using namespace ox;
using misc::FloatVector;

namespace {

constexpr const char* kEffects = R"(<?xml version="1.0" encoding="utf-8"?>
<Effects>
  <gui_effect id="show_window_effect" begin_scale="0.5 0.5" end_scale="1 1" time="200" shift_time="100"
              begin_color="#0 255 255 255"/>
  <gui_effect id="hide_window_effect" begin_scale="1 1" end_scale="0.5 0.5" time="0" shift_time="0"
              end_color="#0 255 255 255"/>
  <gui_effect id="shadow_window_effect" shadow_color="#100 0 0 0" no_shadow_color="#0 0 0 0"/>
</Effects>)";

struct WindowEffects : ::testing::Test {
    core::CSettings settings;
    int now = 1000;
    gui::WidgetPtrT widget {new gui::CWidget()};

    WindowEffects()
    {
        EXPECT_TRUE(settings.LoadXmlFromMemory(kEffects, std::strlen(kEffects), "effects.xml"));
        k17::SetEffectsSettings(&settings.GetChild("Effects"));
        k17::RegisterWindowEffects();
        k17::SetGameClock([this] { return now; });
        widget->SetOffset(100, 100);
        widget->SetSize(200, 100);
    }
    ~WindowEffects() override
    {
        k17::SetGameClock(nullptr);
        k17::SetEffectsSettings(nullptr);
    }
    void At(int time)
    {
        now = time;
        widget->Update();
    }
    template <class T>
    int Count() const
    {
        int n = 0;
        for (const gui::EffectPtrT& e : widget->GetEffects())
            n += dynamic_cast<T*>(e.get()) && !e->IsDead();
        return n;
    }
};

} // namespace

TEST_F(WindowEffects, ShowScalesAboutTheCentreAfterTheShiftAndFadesIn)
{
    widget->AddEffect(k17::CreateEffect(u"show_window_effect"));
    EXPECT_TRUE(widget->GetFlags() & gui::FlagDisabled);
    EXPECT_EQ(widget->GetColor().Alpha, 0);
    EXPECT_EQ(Count<k17::CWindowChangeShadowEffect>(), 1);

    At(1050); // still within the shift: the widget stands as it was
    EXPECT_EQ(widget->GetOffset(), FloatVector(100, 100));
    EXPECT_EQ(widget->GetRotation(), misc::FloatMatrix::Identity());

    At(1200); // half way: scale 0.75, the centre in place
    EXPECT_EQ(widget->GetOffset(), FloatVector(125, 112.5f));
    EXPECT_EQ(widget->GetRotation(), misc::MatrixScale(0.75f, 0.75f));
    EXPECT_EQ(widget->GetColor().Alpha, 127);
    EXPECT_TRUE(widget->GetFlags() & gui::FlagDisabled);

    At(1300);
    EXPECT_EQ(widget->GetOffset(), FloatVector(100, 100));
    EXPECT_EQ(widget->GetRotation(), misc::FloatMatrix::Identity());
    EXPECT_FALSE(widget->GetFlags() & gui::FlagDisabled);
    EXPECT_EQ(widget->GetColor(), graphics::Color(0xFFFFFFFFu));
    // The fading shadow is over and a standing one follows.
    EXPECT_EQ(Count<k17::CWindowChangeShadowEffect>(), 0);
    EXPECT_EQ(Count<k17::CWindowShadowEffect>(), 1);

    // Closing: the standing shadow goes at once; the time of 0 ends the closing at the next
    // update, and the widget is removed.
    widget->AddEffect(k17::CreateEffect(u"hide_window_effect"));
    EXPECT_EQ(Count<k17::CWindowShadowEffect>(), 0);
    EXPECT_EQ(Count<k17::CRemoveWidgetEffect>(), 1);
    At(1300);
    EXPECT_TRUE(widget->GetFlags() & gui::FlagDead);
    EXPECT_EQ(widget->GetRotation(), misc::MatrixScale(0.5f, 0.5f));
    EXPECT_EQ(widget->GetColor().Alpha, 0);
}

TEST_F(WindowEffects, WithoutADescriptionOnlyAnInstantScaleRuns)
{
    EXPECT_FALSE(k17::CreateEffect(u"no_such_effect"));
    k17::SetEffectsSettings(nullptr);
    widget->AddEffect(k17::CreateEffect(u"show_window_effect"));
    EXPECT_EQ(widget->GetEffects().size(), 1u);
    EXPECT_EQ(widget->GetColor(), graphics::Color(0xFFFFFFFFu));
    At(1000);
    EXPECT_FALSE(widget->GetFlags() & gui::FlagDisabled);
    EXPECT_EQ(widget->GetOffset(), FloatVector(100, 100));
}

TEST_F(WindowEffects, ScriptEffectsScaleTowardsATargetAndRemoveLater)
{
    // Towards the widget's own size: the target point is (200, 100) - size / 2 = (100, 50).
    k17::AddEffectToWidget(widget.get(), 100, FloatVector(-1000, -1000), FloatVector(1, 1), FloatVector(0, 0));
    EXPECT_EQ(widget->GetOffset(), FloatVector(100, 100)); // applied at once, at scale 1
    At(1050);
    // s = 0.5: (1 - s) * size / 2 + (pos - target) * s + target.
    EXPECT_EQ(widget->GetOffset(), FloatVector(50 + 0 + 100, 25 + 25 + 50));
    At(1100);
    EXPECT_EQ(widget->GetOffset(), FloatVector(200, 150)); // the end as the base places it
    EXPECT_FALSE(widget->GetFlags() & gui::FlagDisabled);

    k17::AddRemoveEffectToWidget(widget.get(), 500);
    At(1599);
    EXPECT_FALSE(widget->GetFlags() & gui::FlagDead);
    At(1600);
    EXPECT_TRUE(widget->GetFlags() & gui::FlagDead);
}

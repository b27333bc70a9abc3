// The timed effects on their own clocks, which the tests move by hand: a fade's alpha over
// time, a move that takes no time, a flag set at its moment, and effects that end.
#include "core/TimeManager.h"
#include "gui/TimedEffects.h"
#include "gui/Widget.h"
#include "support/TestSupport.h"

using namespace ox::gui;
using ox::graphics::Color;
using ox::misc::FloatVector;

namespace {

// Moves an effect's clock to `ms` after the moment it was added, then updates the widget.
template <class E>
void At(E& effect, unsigned start, unsigned ms, CBaseWidget& widget)
{
    effect.GetTimer()->SetTime(start + ms);
    widget.Update();
}

} // namespace

TEST(Effects, FadeFollowsItsClockAfterTheDelayAndEnds)
{
    WidgetPtrT widget(new CWidget());
    widget->SetColor(Color(0x00FFFFFFu));
    boost::intrusive_ptr<CColorChangeEffect> fade(new CColorChangeEffect(Color(0xFF8040FFu), 1000, 500, ""));
    const unsigned start = fade->GetTime();
    widget->AddEffect(fade);

    At(*fade, start, 400, *widget);
    EXPECT_EQ(widget->GetColor(), Color(0x00FFFFFFu)) << "the delay first";
    At(*fade, start, 1000, *widget);
    EXPECT_EQ(widget->GetColor(), Color(191, 159, 255, 127)) << "half way";
    At(*fade, start, 1500, *widget);
    EXPECT_EQ(widget->GetColor(), Color(0xFF8040FFu));
    EXPECT_TRUE(fade->IsDead());
    widget->Update();
    EXPECT_TRUE(widget->GetEffects().empty()) << "dropped at the next update";
}

TEST(Effects, MoveOfNoDurationJumpsAtTheDelaysEnd)
{
    WidgetPtrT widget(new CWidget());
    widget->SetOffset(10, 10);
    boost::intrusive_ptr<CPositionChangeEffect> move(new CPositionChangeEffect(FloatVector(50, 70), 0, 200, ""));
    const unsigned start = move->GetTime();
    widget->AddEffect(move);
    At(*move, start, 199, *widget);
    EXPECT_EQ(widget->GetOffset(), FloatVector(10, 10));
    At(*move, start, 200, *widget);
    EXPECT_EQ(widget->GetOffset(), FloatVector(50, 70));
    EXPECT_TRUE(move->IsDead());
}

TEST(Effects, FlagEffectSetsItsFlagAtItsMomentAndTheWidgetGoes)
{
    WidgetPtrT parent(new CWidget());
    WidgetPtrT child(new CWidget());
    parent->AddWidget(child);
    boost::intrusive_ptr<CFlagsChangeEffect> kill(new CFlagsChangeEffect(FlagDead, true, 2000, ""));
    const unsigned start = kill->GetTime();
    child->AddEffect(kill);

    At(*kill, start, 1999, *parent);
    EXPECT_FALSE(child->GetFlags() & FlagDead);
    At(*kill, start, 2000, *parent);
    EXPECT_TRUE(child->GetFlags() & FlagDead);
    EXPECT_TRUE(kill->IsDead());
    parent->Update();
    EXPECT_TRUE(parent->GetWidgets().empty());

    boost::intrusive_ptr<CFlagsChangeEffect> show(new CFlagsChangeEffect(FlagHidden, false, 0, ""));
    child->AddFlags(FlagHidden);
    child->AddEffect(show);
    child->Update();
    EXPECT_FALSE(child->GetFlags() & FlagHidden) << "removes with add false";
}

TEST(Effects, EffectsRunOnTheirGroupsClockAndAnUnknownGroupIsLogged)
{
    oxtest::LogCapture log;
    ox::core::CGroupTimer* group = ox::core::GetTimeManager().AttachGroupTimer("fx_test", nullptr);
    boost::intrusive_ptr<CColorChangeEffect> fade(new CColorChangeEffect(Color(0u), 100, 0, "fx_test"));
    EXPECT_EQ(fade->GetTimer()->GetParent(), group);
    boost::intrusive_ptr<CColorChangeEffect> lost(new CColorChangeEffect(Color(0u), 100, 0, "no_such_group"));
    EXPECT_EQ(lost->GetTimer()->GetParent(), ox::core::GetTimeManager().GetRoot());
    EXPECT_TRUE(log.Contains("effect: no timer group \"no_such_group\""));
    // The group goes (as a level's does when it ends): the effect ends at its target.
    WidgetPtrT widget(new CWidget());
    widget->AddEffect(fade);
    group->Destroy();
    widget->Update();
    EXPECT_EQ(widget->GetColor(), Color(0u));
    EXPECT_TRUE(fade->IsDead());
}

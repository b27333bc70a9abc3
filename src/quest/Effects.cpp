#include "quest/Effects.h"

#include "quest/QuestServices.h"

namespace qe {

using namespace ox;

void CEffectsList::AddEffect(BaseEffectPtrT effect)
{
    if (effect)
        m_Effects.push_front(std::move(effect));
}

void CEffectsList::Update()
{
    for (auto it = m_Effects.begin(); it != m_Effects.end();) {
        // Held while it runs: an effect may clear the list.
        BaseEffectPtrT effect = *it;
        it = effect->Update() ? std::next(it) : m_Effects.erase(it);
    }
}

CEffectsList& g_EffectsList::Instance()
{
    static auto* list = new CEffectsList();
    return *list;
}

CAlphaEffect::CAlphaEffect(BaseSceneObjectPtrT object, bool appear, bool hold, float time,
                           const core::CGroupTimer* timer)
    : m_Object(std::move(object)), m_Time(time), m_Appear(appear), m_Hold(hold)
{
    auto* group = const_cast<core::CGroupTimer*>(timer);
    m_Timer = group ? group->AttachTimer() : core::GetTimeManager().AttachTimer(core::GetTimeManager().GetRoot());
}

bool CAlphaEffect::Update()
{
    const core::CTimer* timer = m_Timer.Get();
    const float t = timer ? static_cast<float>(timer->GetTime()) : m_Time + 1.0f;
    if (m_Time > 0.1f)
        m_Object->SetAlpha(m_Hold ? 1.0f : (m_Appear ? t / m_Time : 1.0f - t / m_Time));
    if (t > m_Time) {
        m_Object->SetAlpha(CBaseSceneObject::kNoFade);
        return false;
    }
    return true;
}

void ConnectEffectsServices()
{
    QuestServices& services = GetQuestServices();
    services.startFade = [](CBaseSceneObject& object, bool appear, bool hold, float time,
                            const core::CGroupTimer* timer) {
        g_EffectsList::Instance().AddEffect(new CAlphaEffect(&object, appear, hold, time, timer));
    };
    services.clearEffects = [] { g_EffectsList::Instance().Clear(); };
}

} // namespace qe

#pragma once
// Effects that run by themselves once per frame, with no script stepping them: the list
// advances every running effect and drops those that end. The engine's one effect fades a
// scene object in or out by writing its fade alpha.
#include "core/TimeManager.h"
#include "misc/ptr.h"
#include "quest/SceneObject.h"

#include <list>

namespace qe {

class CBaseEffect : public ox::misc::CRefCountedObj {
public:
    // True while the effect goes on.
    virtual bool Update() { return false; }
};

using BaseEffectPtrT = boost::intrusive_ptr<CBaseEffect>;

class CEffectsList {
public:
    // The newest effect goes to the front.
    void AddEffect(BaseEffectPtrT effect);
    // Advances every effect from the front and drops those that have ended.
    void Update();
    void Clear() { m_Effects.clear(); }
    size_t Count() const { return m_Effects.size(); }

private:
    std::list<BaseEffectPtrT> m_Effects;
};

struct g_EffectsList {
    static CEffectsList& Instance();
};

// Writes the object's fade alpha from its own timer in `timer` (the root when null): up from
// 0 (appear), down from 1, or held at 1, for `time` milliseconds; then no fade (-1).
class CAlphaEffect : public CBaseEffect {
public:
    CAlphaEffect(BaseSceneObjectPtrT object, bool appear, bool hold, float time, const ox::core::CGroupTimer* timer);
    bool Update() override;

private:
    BaseSceneObjectPtrT m_Object;
    float m_Time;
    ox::core::CTimerWrapper m_Timer;
    bool m_Appear;
    bool m_Hold;
};

// Makes the quest tree's group fades run as alpha effects in the list, and a level that goes
// clear the list.
void ConnectEffectsServices();

} // namespace qe

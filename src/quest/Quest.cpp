#include "quest/Quest.h"

#include "diag/Assert.h"
#include "quest/TreeEdit.h"

namespace qe {

void CQuest::InsertLevel(LevelPtrT level, const CLevel* after)
{
    OX_CHECK_DATA(level);
    InsertBehind(m_Levels, std::move(level), after);
}

void CQuest::RemoveLevel(CLevel& level) { RemoveEvery(m_Levels, level); }

CLevel* CQuest::GetLevelById(const std::string& id) const
{
    for (const LevelPtrT& level : m_Levels)
        if (level->GetId() == id)
            return level.get();
    return nullptr;
}

} // namespace qe

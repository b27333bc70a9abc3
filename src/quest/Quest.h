#pragma once
// The whole quest as the editor works on it: its levels, in file order. A running game
// never holds it; it builds one level at a time from the compiled quest data.
#include "misc/GenericIterator.h"
#include "quest/Level.h"

#include <list>
#include <string>

namespace qe {

class CQuest : public CTreeNode {
public:
    using LevelsListT = std::list<LevelPtrT>;
    using LevelIteratorT = ox::misc::CGenericIterator<LevelsListT>;

    // Inserts behind `after`, or at the front when it is null or not in the list.
    virtual void InsertLevel(LevelPtrT level, const CLevel* after);
    virtual void RemoveLevel(CLevel& level);

    unsigned EnumLevels() const { return static_cast<unsigned>(m_Levels.size()); }
    LevelIteratorT GetLevels() { return LevelIteratorT(&m_Levels); }
    const LevelsListT& Levels() const { return m_Levels; }
    CLevel* GetLevelById(const std::string& id) const;

    // The editor's form: a Quest element with every level in full. Load adds the file's
    // levels behind those held; false when the file does not read (logged).
    bool Load(const std::string& path);
    // Written whole to a temporary file and renamed over `path`.
    void Save(const std::string& path) const;

private:
    LevelsListT m_Levels;
};

using QuestPtrT = boost::intrusive_ptr<CQuest>;

} // namespace qe

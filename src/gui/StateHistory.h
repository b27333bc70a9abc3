#pragma once
// The undo and redo history of a value: the states it went through, oldest first, and how
// many of them lead up to the current one. A new state after an undo ends the redo branch.
#include "diag/Assert.h"

#include <cstdint>
#include <deque>

namespace ox::gui {

template <class T>
class StateHistory {
public:
    explicit StateHistory(uint32_t maxStates) : m_MaxStates(maxStates) {}

    // A state equal to the current one adds nothing. The oldest goes when more than the
    // limit are kept, so the history holds at most the limit plus one.
    void Push(const T& state)
    {
        if (!m_States.empty() && m_Position > 0 && m_States[m_Position - 1] == state)
            return;
        if (m_States.size() > m_MaxStates) {
            m_States.pop_front();
            if (m_Position > 0)
                --m_Position;
        }
        while (m_States.size() > m_Position)
            m_States.pop_back();
        m_States.push_back(state);
        m_Position = static_cast<uint32_t>(m_States.size());
    }

    // The first state can't be undone to nothing.
    bool CanUndo() const { return !m_States.empty() && m_Position > 1; }
    const T& Undo()
    {
        OX_ASSERT(CanUndo());
        if (CanUndo())
            --m_Position;
        return m_States[m_Position - 1];
    }
    bool CanRedo() const { return !m_States.empty() && m_Position < m_States.size(); }
    const T& Redo()
    {
        OX_ASSERT(CanRedo());
        if (CanRedo())
            ++m_Position;
        return m_States[m_Position - 1];
    }

    size_t GetCount() const { return m_States.size(); }

private:
    std::deque<T> m_States;
    uint32_t m_Position = 0; // the states up to and including the current one
    uint32_t m_MaxStates;
};

} // namespace ox::gui

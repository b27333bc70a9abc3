#pragma once
// Check boxes of which exactly one is checked. The element's child `buttons` holds one
// element per button (a check box description with a `caption`); they stand in
// `columns_count` columns, filled top to bottom, and the first starts checked. A click on
// another button checks it, unchecks the rest and tells the parent "change_checked" (after
// the button's own "check_changed").
#include "gui/Widget.h"

#include <vector>

namespace ox::gui {

class CCheckboxWidget;

class CRadioButtonGroupWidget : public CWidget {
public:
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    bool ReadsChildElement(std::string_view element) const override { return element == "buttons"; }
    // The bounding box of the buttons.
    FloatVector GetPreferredSize() const override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    // Tells the parent "change_checked".
    virtual void OnChangeChecked();

    // The index of the first checked button, or -1.
    int GetChecked() const;
    // Checks button `index` as a click would (nothing for a checked one or a bad index).
    void Check(int index);
    const std::vector<boost::intrusive_ptr<CCheckboxWidget>>& GetButtons() const { return m_Buttons; }

private:
    void Select(size_t index);

    // Held: a script may take a button out of the tree.
    std::vector<boost::intrusive_ptr<CCheckboxWidget>> m_Buttons;
};

} // namespace ox::gui

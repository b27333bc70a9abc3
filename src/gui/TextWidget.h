#pragma once
// What a window asks of the widget that shows its tool tips: the text and a size that fits
// it. The label widget kind implements it; a window whose label kind doesn't shows no tips.
#include "misc/WideChar.h"

namespace ox::gui {

class ITextWidget {
public:
    virtual void SetText(const wstring& text) = 0;
    virtual void ResizeToFitText() = 0;

protected:
    ~ITextWidget() = default;
};

} // namespace ox::gui

#pragma once
// The mouse pointer: the type widgets ask for as the mouse moves over them, shown as the
// platform's pointer, or with custom cursors on, as an image the GUI draws over the canvas
// (centred on the point). A type that has no image keeps the platform's pointer.
#include "graphics/Image.h"
#include "misc/Rect.h"
#include "misc/Vector.h"

#include <map>
#include <memory>

namespace ox::gui {

class CCursor {
public:
    enum CursorType : int {
        CursorPointer = 0,
        CursorHand = 1,
        CursorText = 2,
        CursorHourglass = 3,
        CursorCustom = 4,
        CursorNone = 5,
    };

    static CCursor& Instance();

    // The pointer moved to a canvas position: unless hidden, the type goes back to the
    // pointer (widgets ask for theirs again on each move).
    void SetPosition(const misc::FloatVector& position);
    const misc::FloatVector& GetPosition() const { return m_Position; }
    void SetCursor(int type);
    int GetCursor() const { return m_Type; }
    // An image of the caller's, shown as the custom type (which it selects); null clears it.
    void SetCustomCursor(graphics::CImage* image);
    void HideCursor(bool hide) { m_Hidden = hide; }
    bool IsHidden() const { return m_Hidden; }
    // With custom cursors on, the declared cursor textures are looked up.
    void EnableCustomCursors(bool enable);
    bool IsCustomCursorsEnabled() const { return m_CustomEnabled; }
    // Brings the platform's pointer in line with the type; once per update and after each move.
    void Refresh();
    // The custom cursor's image at the pointer, when the pointer is over the canvas.
    void Draw(graphics::CRenderer& renderer);
    // Where the canvas lies in the window, and its scale.
    void SetActiveRect(const misc::FloatRect& rect, const misc::FloatVector& scale);
    // The image the custom cursor shows now, or null.
    const graphics::CImage* GetCurrentImage() const { return m_CurrentCursorImage; }

private:
    CCursor() = default;
    void LoadImages();
    // The platform's pointer for the type (hidden for none).
    void ShowSystemPointer(int type);

    int m_Type = CursorNone;
    graphics::CImage* m_CurrentCursorImage = nullptr;
    bool m_Hidden = false;
    bool m_CustomEnabled = false;
    std::map<int, std::unique_ptr<graphics::CImage>> m_Images;
    graphics::CImage* m_CustomImage = nullptr;
    misc::FloatVector m_Position;
    misc::FloatRect m_ActiveRect;
    misc::FloatVector m_Scale {1.0f, 1.0f};
};

} // namespace ox::gui

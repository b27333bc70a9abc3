#pragma once
// The start-up pictures: the game's splash screens from fsdata/ on disk, then up to five
// logos from the game pack, each shown for its time, fading in and out, fitted to the canvas.
// A picture that is missing or not larger than 2 x 2 pixels is left out.
#include "graphics/Texture.h"
#include "gui/controls/ImageWidget.h"

#include <deque>
#include <memory>

namespace k17 {

class CBranch : public ox::gui::CWidget {
public:
    struct Item {
        int m_Duration = 4000;
        int m_Fade = 1000;
        ox::graphics::CSurface* m_Surface = nullptr;
        std::shared_ptr<ox::graphics::CTexture> m_Texture;
    };

    // Reads the pictures; `gameFolder` is where fsdata/ is looked for on disk.
    explicit CBranch(const ox::wstring& gameFolder);

    bool IsDone() const { return m_Done; }
    const std::deque<Item>& GetItems() const { return m_Items; }
    ox::gui::CImageWidget& GetImage() { return *m_Image; }

    void DoUpdate() override;
    void DoDraw(ox::graphics::CRenderer& renderer) override;
    // Covers the canvas, wherever its parent stands.
    void SetParentWidget(ox::gui::CBaseWidget* parent) override;

private:
    void AddPicture(const char* path);
    void ShowNext();
    void Cover();

    std::deque<Item> m_Items;
    boost::intrusive_ptr<ox::gui::CImageWidget> m_Image;
    float m_StartTime = 0.0f;
    bool m_Done = false;
};

} // namespace k17

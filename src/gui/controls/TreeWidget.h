#pragma once
// A tree of icon-and-text nodes: groups open and close by their expand box, nodes are
// selected with Ctrl (toggle) and Shift (a range among siblings), and dragged onto, before or
// behind other nodes. One event handler, usually a script function, hears of additions,
// moves and removals and may veto a new parent or a selection. The tree tells its parent
// "selection_changed". Rows are one font height high; each level is indented by `offset`.
#include "graphics/Image.h"
#include "gui/Widget.h"

#include <functional>
#include <vector>

namespace ox::graphics {
struct CFont;
class CTexture;
}

namespace ox::lua {
class CLua;
}

namespace ox::gui {

class CScrollWidget;
class CImageWidget;

class CTreeWidget : public CWidget {
public:
    class CNode;
    using NodePtrT = boost::intrusive_ptr<CNode>;
    using SelectedNodesT = std::vector<NodePtrT>;

    class CNode : public misc::CRefCountedObj {
    public:
        enum Flags : uint32_t { FlagSelected = 1, FlagExpanded = 2, FlagGroup = 4 };

        // Lets the children go one by one: a long chain of siblings never recurses.
        ~CNode() override;

        graphics::CImage& GetIcon() { return m_Icon; }
        void SetText(const wstring& text) { m_Text = text; }
        const wstring& GetText() const { return m_Text; }
        void SetUserData(int32_t data) { m_UserData = data; }
        int32_t GetUserData() const { return m_UserData; }
        void SetUserType(int32_t type) { m_UserType = type; }
        int32_t GetUserType() const { return m_UserType; }
        // All four components 0: the tree's colours.
        void SetColor(const graphics::Color& color) { m_Color = color; }
        const graphics::Color& GetColor() const { return m_Color; }
        CNode* GetParent() const { return m_Parent; }
        CNode* GetFirstChild() const { return m_FirstChild.get(); }
        CNode* GetNextSibling() const { return m_NextSibling.get(); }
        CNode* GetPrevSibling() const { return m_PrevSibling; }
        CNode* GetLastChild() const;
        void RaiseFlag(uint32_t flag) { m_Flags |= flag; }
        bool ReadFlag(uint32_t flag) const { return (m_Flags & flag) != 0; }
        void ClearFlag(uint32_t flag) { m_Flags &= ~flag; }
        // Whether `node` is this node or lies below it.
        bool Holds(const CNode* node) const;

    private:
        friend class CTreeWidget;
        graphics::Color m_Color {0, 0, 0, 0};
        graphics::CImage m_Icon;
        wstring m_Text;
        int32_t m_UserData = 0;
        int32_t m_UserType = 0;
        CNode* m_Parent = nullptr;
        NodePtrT m_FirstChild;
        CNode* m_PrevSibling = nullptr;
        NodePtrT m_NextSibling;
        uint32_t m_Flags = 0;
    };

    enum Event : int {
        EventNodeAdded = 0,
        EventNodeMoved = 1,
        EventNodeRemoved = 2,
        EventCheckNodeParent = 3,
        EventIconClicked = 4,
        EventTextDoubleClick = 5,
        EventOnNodeSelection = 6,
    };
    // (tree, event, node, second node) -> the answer; see the events.
    using EventHandlerT = std::function<bool(CTreeWidget&, int, CNode&, CNode*)>;
    enum ColorIndex : int { ColorText = 0, ColorSelectedText = 1, ColorSelection = 2, ColorDragTarget = 3 };
    enum DropPlace : int { DropBefore = 0, DropInto = 1, DropBehind = 2 };

    CTreeWidget();
    ~CTreeWidget() override;

    // The tree_template: insets, colours, font (required: without one the load stops), offset,
    // drag line length, check texture (two frames), the two scroll bars and the background.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void SetSize(float width, float height) override;
    FloatVector GetPreferredSize() const override;
    void DoDraw(graphics::CRenderer& renderer) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;

    // A new last child of `parent` (the root when null); null, adding nothing, when the
    // parent isn't a group.
    CNode* AddNode(const char* icon, const wstring& text, CNode* parent, int32_t userType, int32_t userData);
    CNode* AddNode(const wstring& text, CNode* parent, uint32_t flags);
    // Moves the node behind `newPrev` (first when null) under `newParent` (the root when
    // null). False when vetoed, when nothing would change, or for a move the tree can't make.
    bool MoveNode(CNode& node, CNode* newParent, CNode* newPrev);
    void RemoveNode(CNode& node);
    // Opens the ancestors of every selected node, then fits the scrolls.
    void UpdateNodes();
    // Removes every node.
    void Clear();
    void ScrollToNode(const CNode& node);
    // The visible node under a point of the widget, with its row rectangle.
    bool FindNodeByPos(const IntVector& pos, CNode*& node, misc::FloatRect& rect) const;
    CNode* FindNodeByUserData(int32_t data) const;
    CNode* GetFirstNode() const { return m_Root->GetFirstChild(); }
    // The first node of a depth-first walk with the user type.
    CNode* GetFirstNode(int32_t userType) const;
    SelectedNodesT GetSelectedNodes() const;
    void ClearSelection();
    void SetScrollValue(bool vertical, float value);
    float GetScrollValue(bool vertical) const;
    void SetEventHandler(EventHandlerT handler) { m_EventHandler = std::move(handler); }
    // A script function by its dotted name in the host; an empty name removes the handler.
    void SetEventHandler(lua::CLua* host, const char* function);

    CNode& GetRoot() const { return *m_Root; }
    CNode* GetDragTarget() const { return m_DragTarget; }
    int GetDragPlace() const { return m_DragWhere; }
    bool IsDragging() const { return m_IsDragging; }
    CScrollWidget* GetScroll(bool vertical) const;
    void SetTreeColor(int index, const graphics::Color& color);

private:
    struct Row {
        CNode* node;
        misc::FloatRect rect;
    };
    // The answer of the handler; true without one.
    bool Fire(Event event, CNode& node, CNode* other = nullptr);
    // Calls `visit(node, depth)` in depth-first order until it returns false; `visibleOnly`
    // enters only open nodes.
    template <class Visit>
    void Walk(bool visibleOnly, const Visit& visit) const;
    // Calls `visit(row)` for each visible row from the top until it returns false.
    template <class Visit>
    void WalkRows(const Visit& visit) const;
    float RowHeight() const;
    float IconWidth(const CNode& node) const;
    misc::FloatRect ClientRect() const;
    void FitScrolls();
    void UpdateDropTarget();
    void EndDrag();
    void ToggleExpanded(CNode& node);
    bool ClearSelectionBelow(CNode& node, bool includeSelf);
    bool SelectIfAllowed(CNode& node);
    bool ShiftSelect(CNode& node);
    void Unlink(CNode& node);
    void Link(const NodePtrT& node, CNode& parent, CNode* prev);
    void DrawRow(graphics::CRenderer& renderer, const Row& row);
    bool IsIntoPlace(const CNode& target, int where) const;

    NodePtrT m_Root;
    const graphics::CFont* m_Font = nullptr;
    graphics::CImage m_CheckImage;
    float m_Offset = 16;
    graphics::Color m_Colors[4];
    float m_DragLineLength = 40;
    bool m_IsDragging = false;
    IntVector m_DragPos;
    NodePtrT m_DragNode;
    CNode* m_DragTarget = nullptr;
    int m_DragWhere = DropBefore;
    CNode* m_LastClicked = nullptr;
    boost::intrusive_ptr<CScrollWidget> m_HorzScroll;
    boost::intrusive_ptr<CScrollWidget> m_VertScroll;
    boost::intrusive_ptr<CImageWidget> m_Background;
    EventHandlerT m_EventHandler;
};

} // namespace ox::gui

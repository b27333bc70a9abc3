#include "gui/controls/TreeWidget.h"

#include "diag/Log.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "gui/Description.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/ScrollWidget.h"
#include "lua/Lua.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

using Node = CTreeWidget::CNode;

// Nodes ---------------------------------------------------------------------------------------

CTreeWidget::CNode::~CNode()
{
    // The children one by one: each is cut from the chain before it goes, so that a long
    // chain never recurses, and one a script still holds is left outside any tree.
    NodePtrT child = std::move(m_FirstChild);
    while (child) {
        NodePtrT next = std::move(child->m_NextSibling);
        child->m_Parent = nullptr;
        child->m_PrevSibling = nullptr;
        child = std::move(next);
    }
}

Node* CTreeWidget::CNode::GetLastChild() const
{
    CNode* child = m_FirstChild.get();
    while (child && child->m_NextSibling)
        child = child->m_NextSibling.get();
    return child;
}

bool CTreeWidget::CNode::Holds(const CNode* node) const
{
    for (; node; node = node->m_Parent)
        if (node == this)
            return true;
    return false;
}

// Loading and layout ---------------------------------------------------------------------------

namespace {

constexpr uint32_t kAllAnchors = AnchorLeft | AnchorRight | AnchorTop | AnchorBottom;
constexpr const char* kColorKeys[4] = {"color_text_normal", "color_text_selected", "color_selection",
                                       "color_drag_target"};

bool Contains(const misc::FloatRect& rect, const misc::IntVector& pos)
{
    const float x = static_cast<float>(pos.X), y = static_cast<float>(pos.Y);
    return x >= rect.X && x < rect.X + rect.Width && y >= rect.Y && y < rect.Y + rect.Height;
}

} // namespace

CTreeWidget::CTreeWidget() : CWidget({}, LayerTop, BroadcastOnMouseUp), m_Root(new CNode())
{
    m_Root->RaiseFlag(CNode::FlagGroup | CNode::FlagExpanded);
    m_Colors[ColorText] = graphics::Color(0xFFFFFFFFu);
    m_Colors[ColorSelectedText] = graphics::Color(0xFF000000u);
    m_Colors[ColorSelection] = graphics::Color(0xFFC0C0FFu);
    m_Colors[ColorDragTarget] = graphics::Color(0xFFFFC040u);
    m_VertScroll = new CScrollWidget(true);
    m_HorzScroll = new CScrollWidget(false);
}

CTreeWidget::~CTreeWidget() = default;

void CTreeWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "tree_template");
    CWidget::Load(node, templates);
    if (const core::CSettingsGroup* insets = tmpl.GetChildRef("insets")) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        SetInsets(read);
    }
    for (int i = 0; i < 4; ++i)
        ReadColorChecked(tmpl, kColorKeys[i], m_Colors[i]);
    m_Font = ReadFont(tmpl, "font");
    if (!m_Font) {
        ReportElement(node, "a tree needs a font (m_Font); the tree stays empty and draws nothing");
        return;
    }
    ReadChecked(tmpl, "offset", m_Offset, 0, kMaxDescriptionSize);
    ReadChecked(tmpl, "drag_line_length", m_DragLineLength, 0, kMaxDescriptionSize);
    if (ReadImage(tmpl, "check_texture", m_CheckImage) && m_CheckImage.GetTexture()->GetFramesCount() < 2)
        ReportElement(tmpl, "the check texture needs two frames (open, closed); the open one is drawn for both");

    m_Background = new CImageWidget();
    m_Background->SetImage(tmpl.GetValue("background").c_str());
    m_Background->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    m_Background->SetAnchors(kAllAnchors);
    m_Background->SetLayer(1);
    AddWidget(m_Background);

    const float step = static_cast<float>(m_Font->PixHeight);
    m_VertScroll->Load(tmpl.GetChild("vertical_scroll"), templates);
    m_VertScroll->SetAnchors(AnchorRight | AnchorTop | AnchorBottom);
    m_VertScroll->SetMouseWheelK(step);
    m_VertScroll->SetButtonValue(step);
    m_HorzScroll->Load(tmpl.GetChild("horizontal_scroll"), templates);
    m_HorzScroll->SetAnchors(AnchorLeft | AnchorRight | AnchorBottom);
    for (CScrollWidget* scroll : {m_VertScroll.get(), m_HorzScroll.get()}) {
        scroll->SetLayer(2);
        AddWidget(scroll);
    }
    SetSize(GetSize().X, GetSize().Y);
}

misc::FloatRect CTreeWidget::ClientRect() const
{
    const misc::FloatInsets& in = GetInsets();
    return {in.Left, in.Top, std::max(0.0f, GetSize().X - in.Left - in.Right),
            std::max(0.0f, GetSize().Y - in.Top - in.Bottom)};
}

void CTreeWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    if (m_Background)
        m_Background->SetSize(width, height);
    // Both bars inside the client rectangle: the vertical at its right edge, the horizontal
    // at its bottom edge.
    const misc::FloatRect client = ClientRect();
    const float barW = m_VertScroll->GetSize().X, barH = m_HorzScroll->GetSize().Y;
    m_VertScroll->SetOffset(client.X + client.Width - barW, client.Y);
    m_VertScroll->SetSize(barW, std::max(0.0f, client.Height - barH));
    m_HorzScroll->SetOffset(client.X, client.Y + client.Height - barH);
    m_HorzScroll->SetSize(std::max(0.0f, client.Width - barW), barH);
    FitScrolls();
}

misc::FloatVector CTreeWidget::GetPreferredSize() const
{
    const FloatVector v = m_VertScroll->GetPreferredSize(), h = m_HorzScroll->GetPreferredSize();
    const float font = m_Font ? static_cast<float>(m_Font->PixHeight) : 0;
    return {v.X + h.X + 2 * m_Offset, std::max(v.Y + h.Y, font)};
}

float CTreeWidget::RowHeight() const { return m_Font ? static_cast<float>(m_Font->PixHeight) : 0; }

float CTreeWidget::IconWidth(const CNode& node) const { return node.m_Icon.GetTextureSize().X; }

void CTreeWidget::SetTreeColor(int index, const graphics::Color& color)
{
    if (index >= 0 && index < 4)
        m_Colors[index] = color;
}

// Walks ------------------------------------------------------------------------------------------

template <class Visit>
void CTreeWidget::Walk(bool visibleOnly, const Visit& visit) const
{
    CNode* node = m_Root->GetFirstChild();
    int depth = 0;
    while (node) {
        if (!visit(*node, depth))
            return;
        if (node->m_FirstChild && (!visibleOnly || node->ReadFlag(CNode::FlagExpanded))) {
            node = node->m_FirstChild.get();
            ++depth;
            continue;
        }
        while (!node->m_NextSibling) {
            node = node->m_Parent;
            --depth;
            if (!node || node == m_Root.get())
                return;
        }
        node = node->m_NextSibling.get();
    }
}

template <class Visit>
void CTreeWidget::WalkRows(const Visit& visit) const
{
    if (!m_Font)
        return;
    const misc::FloatRect client = ClientRect();
    const float left = client.X - GetScrollValue(false), height = RowHeight();
    float y = client.Y - GetScrollValue(true);
    Walk(true, [&](CNode& node, int depth) {
        const float x = left + static_cast<float>(depth) * m_Offset;
        const float width = m_Offset + IconWidth(node) + static_cast<float>(m_Font->GetStringWidth(node.m_Text));
        const bool more = visit(Row {&node, {x, y, width, height + 1}});
        y += height;
        return more;
    });
}

bool CTreeWidget::FindNodeByPos(const IntVector& pos, CNode*& node, misc::FloatRect& rect) const
{
    node = nullptr;
    WalkRows([&](const Row& row) {
        if (row.rect.Y > static_cast<float>(pos.Y))
            return false;
        if (!Contains(row.rect, pos))
            return true;
        node = row.node;
        rect = row.rect;
        return false;
    });
    return node != nullptr;
}

Node* CTreeWidget::FindNodeByUserData(int32_t data) const
{
    CNode* found = nullptr;
    Walk(false, [&](CNode& node, int) {
        if (node.m_UserData == data)
            found = &node;
        return !found;
    });
    return found;
}

Node* CTreeWidget::GetFirstNode(int32_t userType) const
{
    CNode* found = nullptr;
    Walk(false, [&](CNode& node, int) {
        if (node.m_UserType == userType)
            found = &node;
        return !found;
    });
    return found;
}

CTreeWidget::SelectedNodesT CTreeWidget::GetSelectedNodes() const
{
    SelectedNodesT selected;
    Walk(false, [&](CNode& node, int) {
        if (node.ReadFlag(CNode::FlagSelected))
            selected.emplace_back(&node);
        return true;
    });
    return selected;
}

// Scrolls ---------------------------------------------------------------------------------------

CScrollWidget* CTreeWidget::GetScroll(bool vertical) const
{
    return vertical ? m_VertScroll.get() : m_HorzScroll.get();
}

void CTreeWidget::SetScrollValue(bool vertical, float value) { GetScroll(vertical)->SetValue(value); }

float CTreeWidget::GetScrollValue(bool vertical) const { return GetScroll(vertical)->GetValue(); }

void CTreeWidget::FitScrolls()
{
    if (!m_Font)
        return;
    float widest = 0;
    int rows = 0;
    Walk(true, [&](CNode& node, int depth) {
        const float right = static_cast<float>(depth) * m_Offset + m_Offset + IconWidth(node) +
                            static_cast<float>(m_Font->GetStringWidth(node.m_Text));
        widest = std::max(widest, right);
        ++rows;
        return true;
    });
    const misc::FloatRect client = ClientRect();
    m_VertScroll->SetMaxValue(static_cast<float>(rows) * RowHeight() + 1);
    m_VertScroll->SetPageSize(client.Height - m_HorzScroll->GetSize().Y);
    m_HorzScroll->SetMaxValue(widest + m_Offset);
    const float page = client.Width - m_VertScroll->GetSize().X;
    m_HorzScroll->SetPageSize(page);
    m_HorzScroll->SetButtonValue(page / 2);
    UpdateDropTarget();
}

void CTreeWidget::ScrollToNode(const CNode& node)
{
    float x = 0, y = 0;
    bool found = false;
    int row = 0;
    Walk(true, [&](CNode& visited, int depth) {
        if (&visited == &node) {
            x = static_cast<float>(depth) * m_Offset;
            y = static_cast<float>(row) * RowHeight();
            found = true;
        }
        ++row;
        return !found;
    });
    if (!found)
        return;
    SetScrollValue(false, x);
    SetScrollValue(true, std::max(0.0f, y - 3 * RowHeight()));
}

// Editing ---------------------------------------------------------------------------------------

bool CTreeWidget::Fire(Event event, CNode& node, CNode* other)
{
    if (!m_EventHandler)
        return true;
    // The handler may change the tree: the node and the tree stay alive through the call.
    NodePtrT held(&node);
    WidgetPtrT self(this);
    EventHandlerT handler = m_EventHandler;
    return handler(*this, event, node, other);
}

void CTreeWidget::SetEventHandler(lua::CLua* host, const char* function)
{
    if (!host || !function || !*function) {
        m_EventHandler = nullptr;
        return;
    }
    // The script's answer: false or nil vetoes; a function that fails is reported ("Lua
    // Error") and answers true, so that a broken handler leaves the tree usable.
    m_EventHandler = [host, name = std::string(function)](CTreeWidget& tree, int event, CNode& node, CNode* other) {
        lua_State* L = host->GetLuaState();
        if (!lua::detail::BeginCall(*host, L, name.c_str(), 4))
            return true;
        lua::detail::PushArgument(*host, L, &tree);
        lua::detail::PushArgument(*host, L, event);
        lua::detail::PushArgument(*host, L, &node);
        lua::detail::PushArgument(*host, L, other);
        if (!lua::detail::FinishCall(*host, L, 4, 1))
            return true;
        const bool answer = lua_toboolean(L, -1) != 0;
        lua_pop(L, 1);
        return answer;
    };
}

Node* CTreeWidget::AddNode(const char* icon, const wstring& text, CNode* parent, int32_t userType, int32_t userData)
{
    CNode* owner = parent ? parent : m_Root.get();
    OX_CHECK_DATA(owner->ReadFlag(CNode::FlagGroup), nullptr);
    NodePtrT node(new CNode());
    if (icon && *icon)
        node->m_Icon.SetTexture(icon);
    node->m_Text = text;
    node->m_UserType = userType;
    node->m_UserData = userData;
    Link(node, *owner, owner->GetLastChild());
    FitScrolls();
    Fire(EventNodeAdded, *node);
    return node.get();
}

Node* CTreeWidget::AddNode(const wstring& text, CNode* parent, uint32_t flags)
{
    CNode* node = AddNode(nullptr, text, parent, 0, 0);
    if (node && flags) {
        node->m_Flags |= flags;
        FitScrolls();
    }
    return node;
}

void CTreeWidget::Link(const NodePtrT& node, CNode& parent, CNode* prev)
{
    node->m_Parent = &parent;
    node->m_PrevSibling = prev;
    NodePtrT& slot = prev ? prev->m_NextSibling : parent.m_FirstChild;
    node->m_NextSibling = std::move(slot);
    if (node->m_NextSibling)
        node->m_NextSibling->m_PrevSibling = node.get();
    slot = node;
}

void CTreeWidget::Unlink(CNode& node)
{
    NodePtrT held(&node);
    NodePtrT& slot = node.m_PrevSibling ? node.m_PrevSibling->m_NextSibling : node.m_Parent->m_FirstChild;
    if (node.m_NextSibling)
        node.m_NextSibling->m_PrevSibling = node.m_PrevSibling;
    slot = std::move(node.m_NextSibling);
    node.m_Parent = nullptr;
    node.m_PrevSibling = nullptr;
}

bool CTreeWidget::MoveNode(CNode& node, CNode* newParent, CNode* newPrev)
{
    CNode* parent = newParent ? newParent : m_Root.get();
    if (!Fire(EventCheckNodeParent, node, parent == m_Root.get() ? nullptr : parent))
        return false;
    OX_CHECK_DATA(&node != m_Root.get(), false);
    OX_CHECK_DATA(node.m_Parent && m_Root->Holds(&node), false);
    OX_CHECK_DATA(!newPrev || newPrev->m_Parent == parent, false);
    OX_CHECK_DATA(parent->ReadFlag(CNode::FlagGroup), false);
    OX_CHECK_DATA(!node.Holds(parent) && newPrev != &node, false);
    if (node.m_Parent == parent && node.m_PrevSibling == newPrev)
        return false;
    NodePtrT held(&node);
    CNode* oldParent = node.m_Parent;
    Unlink(node);
    Link(held, *parent, newPrev);
    FitScrolls();
    Fire(EventNodeMoved, node, oldParent);
    return true;
}

void CTreeWidget::RemoveNode(CNode& node)
{
    OX_CHECK_DATA(&node != m_Root.get());
    OX_CHECK_DATA(node.m_Parent && m_Root->Holds(&node));
    NodePtrT held(&node);
    Unlink(node);
    if (node.Holds(m_DragNode.get()) || node.Holds(m_DragTarget))
        EndDrag();
    if (node.Holds(m_LastClicked))
        m_LastClicked = nullptr;
    FitScrolls();
    Fire(EventNodeRemoved, node);
}

void CTreeWidget::UpdateNodes()
{
    Walk(false, [](CNode& node, int) {
        if (node.ReadFlag(CNode::FlagSelected))
            for (CNode* up = node.m_Parent; up; up = up->m_Parent)
                up->RaiseFlag(CNode::FlagExpanded);
        return true;
    });
    FitScrolls();
}

void CTreeWidget::Clear()
{
    EndDrag();
    m_LastClicked = nullptr;
    m_Root = new CNode();
    m_Root->RaiseFlag(CNode::FlagGroup | CNode::FlagExpanded);
    FitScrolls();
}

// Selection -------------------------------------------------------------------------------------

bool CTreeWidget::ClearSelectionBelow(CNode& top, bool includeSelf)
{
    bool changed = false;
    auto clear = [&changed](CNode& node) {
        changed = changed || node.ReadFlag(CNode::FlagSelected);
        node.ClearFlag(CNode::FlagSelected);
    };
    if (includeSelf)
        clear(top);
    // A walk of the subtree alone: down from its first child, never past `top`.
    CNode* node = top.GetFirstChild();
    while (node) {
        clear(*node);
        if (node->m_FirstChild) {
            node = node->m_FirstChild.get();
            continue;
        }
        while (node != &top && !node->m_NextSibling)
            node = node->m_Parent;
        node = node == &top ? nullptr : node->m_NextSibling.get();
    }
    return changed;
}

void CTreeWidget::ClearSelection() { ClearSelectionBelow(*m_Root, false); }

bool CTreeWidget::SelectIfAllowed(CNode& node)
{
    if (!Fire(EventOnNodeSelection, node))
        return false;
    node.RaiseFlag(CNode::FlagSelected);
    return true;
}

bool CTreeWidget::ShiftSelect(CNode& node)
{
    ClearSelectionBelow(*m_Root, false);
    bool inside = false;
    for (CNode* sibling = node.m_Parent->GetFirstChild(); sibling; sibling = sibling->GetNextSibling()) {
        const bool end = sibling == &node || sibling == m_LastClicked;
        if (end)
            inside = !inside;
        if (inside || end)
            SelectIfAllowed(*sibling);
        if (end && !inside)
            break;
    }
    TellParent(*this, "selection_changed");
    return true;
}

void CTreeWidget::ToggleExpanded(CNode& node)
{
    if (node.ReadFlag(CNode::FlagExpanded)) {
        node.ClearFlag(CNode::FlagExpanded);
        if (ClearSelectionBelow(node, false))
            TellParent(*this, "selection_changed");
    } else {
        node.RaiseFlag(CNode::FlagExpanded);
    }
    FitScrolls();
}

// Dragging --------------------------------------------------------------------------------------

bool CTreeWidget::IsIntoPlace(const CNode& target, int where) const
{
    return where == DropInto ||
           (where == DropBehind && target.ReadFlag(CNode::FlagExpanded) && target.m_FirstChild != nullptr);
}

void CTreeWidget::EndDrag()
{
    m_IsDragging = false;
    m_DragNode = nullptr;
    m_DragTarget = nullptr;
}

void CTreeWidget::UpdateDropTarget()
{
    if (!m_IsDragging || !m_DragNode)
        return;
    m_DragTarget = nullptr;
    CNode* target = nullptr;
    misc::FloatRect rect;
    if (!FindNodeByPos(m_DragPos, target, rect))
        return;
    const float k = (static_cast<float>(m_DragPos.Y) - rect.Y) / std::max(rect.Height, 1.0f);
    int where;
    if (target->ReadFlag(CNode::FlagGroup))
        where = k < 1.0f / 3 ? DropBefore : k < 2.0f / 3 ? DropInto : DropBehind;
    else
        where = k < 0.5f ? DropBefore : DropBehind;
    const bool into = IsIntoPlace(*target, where);
    CNode* parent = into ? target : target->m_Parent;
    CNode& dragged = *m_DragNode;
    // Never into itself or below itself, and never where it already stands.
    if (dragged.Holds(parent) || target == &dragged)
        return;
    if (!into && ((where == DropBefore && target == dragged.GetNextSibling()) ||
                  (where == DropBehind && target == dragged.GetPrevSibling())))
        return;
    if (parent != dragged.m_Parent && !Fire(EventCheckNodeParent, dragged, parent == m_Root.get() ? nullptr : parent))
        return;
    m_DragTarget = target;
    m_DragWhere = where;
}

// Input -----------------------------------------------------------------------------------------

bool CTreeWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (CWidget::OnMouseDown(pos, button, keys, broadcast))
        return true;
    if (broadcast)
        return false;
    WidgetPtrT self(this);
    CNode* node = nullptr;
    misc::FloatRect rect;
    if (!FindNodeByPos(pos, node, rect)) {
        if (ClearSelectionBelow(*m_Root, false))
            TellParent(*this, "selection_changed");
        return false;
    }
    const float x = static_cast<float>(pos.X);
    if (node->ReadFlag(CNode::FlagGroup) && x < rect.X + m_Offset) {
        ToggleExpanded(*node);
        return true;
    }
    NodePtrT held(node);
    const float iconStart = rect.X + m_Offset;
    if (x >= iconStart && x < iconStart + IconWidth(*node) && Fire(EventIconClicked, *node))
        return true;
    if ((keys & ShiftPressed) && m_LastClicked && m_LastClicked != node && m_LastClicked->m_Parent == node->m_Parent &&
        node->m_Parent)
        return ShiftSelect(*node);
    m_LastClicked = node;
    if (!(keys & ControlPressed)) {
        ClearSelectionBelow(*m_Root, false);
        if (SelectIfAllowed(*node) && node->m_Parent) {
            m_IsDragging = true;
            m_DragPos = pos;
            m_DragNode = node;
            m_DragTarget = nullptr;
            UpdateDropTarget();
        }
    } else if (node->ReadFlag(CNode::FlagSelected)) {
        node->ClearFlag(CNode::FlagSelected);
    } else {
        SelectIfAllowed(*node);
    }
    TellParent(*this, "selection_changed");
    return true;
}

bool CTreeWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (m_IsDragging) {
        m_DragPos = pos;
        // Near an edge (within a row's height) the tree scrolls towards it.
        const float edge = RowHeight(), x = static_cast<float>(pos.X), y = static_cast<float>(pos.Y);
        const FloatVector size = GetSize();
        if (x <= edge)
            SetScrollValue(false, GetScrollValue(false) - 1);
        else if (x >= size.X - edge)
            SetScrollValue(false, GetScrollValue(false) + 1);
        if (y <= edge)
            SetScrollValue(true, GetScrollValue(true) - 1);
        else if (y >= size.Y - edge)
            SetScrollValue(true, GetScrollValue(true) + 1);
        UpdateDropTarget();
    }
    return CWidget::OnMouseMove(pos, keys, broadcast) || m_IsDragging;
}

bool CTreeWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (CWidget::OnMouseUp(pos, button, keys, broadcast))
        return true;
    if (!m_IsDragging)
        return false;
    WidgetPtrT self(this);
    UpdateDropTarget();
    NodePtrT node = m_DragNode, target(m_DragTarget);
    const int where = m_DragWhere;
    EndDrag();
    if (!target || broadcast)
        return false;
    bool moved;
    if (IsIntoPlace(*target, where)) {
        if (!target->m_FirstChild)
            target->RaiseFlag(CNode::FlagExpanded);
        CNode* last = target->GetLastChild();
        moved = last != node.get() && MoveNode(*node, target.get(), last);
    } else {
        CNode* prev = where == DropBehind ? target.get() : target->m_PrevSibling;
        moved = MoveNode(*node, target->m_Parent, prev);
    }
    if (moved) {
        ClearSelectionBelow(*node, true);
        FitScrolls();
        TellParent(*this, "selection_changed");
    }
    return true;
}

bool CTreeWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    if (CWidget::OnDoubleClick(pos, keys, broadcast))
        return true;
    CNode* node = nullptr;
    misc::FloatRect rect;
    if (broadcast || !FindNodeByPos(pos, node, rect))
        return false;
    WidgetPtrT self(this);
    NodePtrT held(node);
    const float x = static_cast<float>(pos.X), iconStart = rect.X + m_Offset;
    if (x >= iconStart && x < iconStart + IconWidth(*node)) {
        if (Fire(EventIconClicked, *node))
            return true;
    } else if (x >= iconStart && Fire(EventTextDoubleClick, *node)) {
        return true;
    }
    if (node->ReadFlag(CNode::FlagGroup) && node->m_Parent)
        ToggleExpanded(*node);
    return true;
}

bool CTreeWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (CWidget::OnMouseWheel(pos, delta, keys, broadcast))
        return true;
    m_VertScroll->OnMouseWheel(pos, delta, keys, broadcast);
    UpdateDropTarget();
    return true;
}

// Drawing ---------------------------------------------------------------------------------------

void CTreeWidget::DoDraw(graphics::CRenderer& renderer)
{
    CWidget::DoDraw(renderer);
    if (!m_Font)
        return;
    misc::FloatRect clip = ClientRect();
    clip.Width = std::max(0.0f, clip.Width - m_VertScroll->GetSize().X);
    clip.Height = std::max(0.0f, clip.Height - m_HorzScroll->GetSize().Y);
    renderer.PushState();
    renderer.SetClipPoly(misc::RectToPoly4(clip));
    const float bottom = clip.Y + clip.Height;
    WalkRows([&](const Row& row) {
        if (row.rect.Y + row.rect.Height >= clip.Y)
            DrawRow(renderer, row);
        return row.rect.Y < bottom;
    });
    renderer.PopState();
}

void CTreeWidget::DrawRow(graphics::CRenderer& renderer, const Row& row)
{
    const CNode& node = *row.node;
    const float x = row.rect.X, y = row.rect.Y, height = RowHeight();
    bool selected = node.ReadFlag(CNode::FlagSelected);
    bool dropInto = false;
    if (m_IsDragging && m_DragTarget == &node) {
        if (IsIntoPlace(node, m_DragWhere)) {
            selected = dropInto = true;
        } else {
            const float lineY = m_DragWhere == DropBefore ? y : y + height;
            renderer.RenderLine({x + m_Offset, lineY}, {x + m_Offset + m_DragLineLength, lineY},
                                m_Colors[ColorDragTarget]);
        }
    }
    if (node.ReadFlag(CNode::FlagGroup) && m_CheckImage.HasTexture()) {
        const graphics::CTexture* box = m_CheckImage.GetTexture();
        const unsigned frame = node.m_FirstChild && !node.ReadFlag(CNode::FlagExpanded) ? 1 : 0;
        renderer.RenderTexture(box, std::floor(x + (m_Offset - box->GetWidth()) / 2),
                               std::floor(y + (height - box->GetHeight()) / 2), frame);
    }
    const float iconX = x + m_Offset;
    if (node.m_Icon.HasTexture()) {
        const FloatVector icon = node.m_Icon.GetTextureSize();
        renderer.RenderTexture(node.m_Icon.GetTexture(), iconX, std::floor(y + (height - icon.Y) / 2));
    }
    const float textX = iconX + IconWidth(node);
    if (selected)
        renderer.RenderFilledPoly4(misc::RectToPoly4({textX, y, row.rect.Width - m_Offset - IconWidth(node), height}),
                                   m_Colors[dropInto ? ColorDragTarget : ColorSelection]);
    const bool own = !(node.m_Color == graphics::Color(0, 0, 0, 0));
    const graphics::Color& color = selected ? m_Colors[ColorSelectedText] : own ? node.m_Color : m_Colors[ColorText];
    renderer.RenderString(m_Font, node.m_Text, textX, y, graphics::JustifyLeft, graphics::JustifyTop, 1.0f, color);
}

} // namespace ox::gui

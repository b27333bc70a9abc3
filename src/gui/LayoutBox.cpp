#include "gui/LayoutBox.h"

#include "core/SettingsReaders.h"
#include "gui/Description.h"
#include "gui/WidgetFactory.h"

#include <boost/make_shared.hpp>

#include <algorithm>
#include <array>
#include <utility>

namespace ox::gui {

using misc::FloatVector;

namespace {

constexpr int kMaxFlex = 10000;
// Descriptions nest far less deeply than this; deeper nesting is taken for a runaway.
constexpr size_t kMaxLoadDepth = 64;

// The description elements being loaded, outermost first. An element met again while it is
// being loaded comes back through templates: its content is skipped, which ends the cycle.
std::vector<const core::CSettingsGroup*> g_LoadPath;

class LoadPathEntry {
public:
    explicit LoadPathEntry(const core::CSettingsGroup& node) { g_LoadPath.push_back(&node); }
    ~LoadPathEntry() { g_LoadPath.pop_back(); }
    LoadPathEntry(const LoadPathEntry&) = delete;
    LoadPathEntry& operator=(const LoadPathEntry&) = delete;
};

// The value of a word attribute among `words`; an unknown word is logged and changes nothing.
template <class T, size_t N>
void ReadWord(const core::CSettingsGroup& node, const char* name, const std::array<std::pair<const char*, T>, N>& words,
              T& value)
{
    if (!node.IsValue(name))
        return;
    const std::string& text = node.GetValue(name);
    for (const auto& [word, meaning] : words)
        if (text == word) {
            value = meaning;
            return;
        }
    ReportElement(node, "unknown value, ignored: ", std::string(name) + "=\"" + text + "\"");
}

bool IsBoxElement(std::string_view name) { return name == "hbox" || name == "vbox" || name == "spacer"; }

// The share of the alignment or packing that moves a child: none at the start, half in the
// centre, all at the end.
float PlacementFactor(bool center, bool end) { return center ? 0.5f : (end ? 1.0f : 0.0f); }

} // namespace

// Loading ---------------------------------------------------------------------------------

void CLayoutBox::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates, CBaseWidget* widget)
{
    LoadFrom(node, templates, widget, widget);
}

void CLayoutBox::LoadFrom(const core::CSettingsGroup& node, const core::CSettingsGroup& templates,
                          CBaseWidget* widget, CBaseWidget* owner)
{
    m_Widget = widget;
    LoadAttributes(node);
    if (std::find(g_LoadPath.begin(), g_LoadPath.end(), &node) != g_LoadPath.end()) {
        ReportElement(node, "contains itself through templates; its content is skipped");
        return;
    }
    if (g_LoadPath.size() >= kMaxLoadDepth) {
        ReportElement(node, "nested too deeply; its content is skipped");
        return;
    }
    LoadPathEntry entry(node);
    LoadChildren(node, templates, owner);
}

void CLayoutBox::LoadAttributes(const core::CSettingsGroup& node)
{
    float width = 0, height = 0;
    ReadChecked(node, "width", width, 0, kMaxDescriptionSize);
    ReadChecked(node, "height", height, 0, kMaxDescriptionSize);
    SetMinSize(width, height);
    core::ReadBool(node, "abs_pos", m_AbsPos);
    static constexpr std::array<std::pair<const char*, bool>, 2> orients {{{"horizontal", true}, {"vertical", false}}};
    ReadWord(node, "orient", orients, m_Horizontal);
    ReadChecked(node, "flex", m_Flex, 0, kMaxFlex);
    static constexpr std::array<std::pair<const char*, Align>, 4> aligns {
        {{"stretch", AlignStretch}, {"start", AlignStart}, {"center", AlignCenter}, {"end", AlignEnd}}};
    ReadWord(node, "align", aligns, m_Align);
    static constexpr std::array<std::pair<const char*, Pack>, 3> packs {
        {{"start", PackStart}, {"center", PackCenter}, {"end", PackEnd}}};
    ReadWord(node, "pack", packs, m_Pack);

    if (const core::CSettingsGroup* insets = node.GetChildRef("insets")) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        if (m_Widget)
            m_Widget->SetInsets(read);
        else
            m_Insets = read;
    }
}

void CLayoutBox::LoadChildren(const core::CSettingsGroup& node, const core::CSettingsGroup& templates,
                              CBaseWidget* owner)
{
    const CWidgetFactory& factory = GetWidgetFactory();
    for (const core::SettingsGroupPtrT& child : node.GetChildren()) {
        const std::string_view name = child->GetId().view();
        if (IsBoxElement(name)) {
            auto box = boost::make_shared<CLayoutBox>();
            box->m_Horizontal = name == "hbox";
            box->LoadFrom(*child, templates, nullptr, owner);
            m_Children.push_back(std::move(box));
        } else if (factory.IsRegistered(name)) {
            if (!owner) {
                ReportElement(*child, "a widget with no widget above it, skipped");
                continue;
            }
            WidgetPtrT widget = factory.Create(name, *child, templates);
            if (widget && widget->GetLayoutBox())
                m_Children.push_back(widget->GetLayoutBox());
            owner->AddWidget(widget);
        } else if (name != "insets" && !(owner && owner->ReadsChildElement(name))) {
            ReportElement(*child, "neither a box nor a known widget kind, skipped");
        }
    }
}

// Measuring -------------------------------------------------------------------------------

template <class SizeOf>
CLayoutBox::Sums CLayoutBox::Sum(const SizeOf& sizeOf) const
{
    Sums sums;
    // The flexible room is the largest main size per flex unit, times the flex sum.
    float perFlex = 0;
    for (const LayoutBoxPtrT& child : m_Children) {
        if (child->m_AbsPos)
            continue;
        const FloatVector size = sizeOf(*child);
        if (child->m_Flex == 0) {
            sums.fixed += Main(size);
        } else {
            sums.flexSum += child->m_Flex;
            perFlex = std::max(perFlex, Main(size) / static_cast<float>(child->m_Flex));
        }
        sums.maxCross = std::max(sums.maxCross, Cross(size));
        ++sums.count;
    }
    sums.flexible = perFlex * static_cast<float>(sums.flexSum);
    return sums;
}

FloatVector CLayoutBox::ContentSize(const Sums& sums) const
{
    const misc::FloatInsets& insets = GetInsets();
    FloatVector size = FromAxes(sums.fixed + sums.flexible, sums.maxCross);
    size.X += insets.Left + insets.Right;
    size.Y += insets.Top + insets.Bottom;
    if (m_Widget) {
        const FloatVector preferred = m_Widget->GetPreferredSize();
        size = {std::max(size.X, preferred.X), std::max(size.Y, preferred.Y)};
    }
    return size;
}

void CLayoutBox::MeasureTree()
{
    for (const LayoutBoxPtrT& child : m_Children)
        child->MeasureTree();
    const Sums sums = Sum([](const CLayoutBox& box) { return box.GetSize(); });
    if (sums.count > 0) {
        const FloatVector size = ContentSize(sums);
        SetBoxSize(size.X, size.Y);
        return;
    }
    // Without content a widget box is what the widget prefers, and a bare box stays as it is.
    if (!m_Widget)
        return;
    const FloatVector size = GetSize(), preferred = m_Widget->GetPreferredSize();
    const FloatVector wanted(std::max(size.X, preferred.X), std::max(size.Y, preferred.Y));
    if (!(wanted == size))
        SetBoxSize(wanted.X, wanted.Y);
}

FloatVector CLayoutBox::ComputePreferredSize() const
{
    const Sums sums = Sum([](const CLayoutBox& box) { return box.ComputePreferredSize(); });
    FloatVector size;
    if (sums.count > 0) {
        size = ContentSize(sums);
    } else if (m_Widget) {
        const FloatVector present = GetSize(), preferred = m_Widget->GetPreferredSize();
        size = {std::max(present.X, preferred.X), std::max(present.Y, preferred.Y)};
    }
    return {std::max(size.X, m_MinSize.X), std::max(size.Y, m_MinSize.Y)};
}

// Sizing and placing ----------------------------------------------------------------------

FloatVector CLayoutBox::GetSize() const { return m_Widget ? m_Widget->GetSize() : m_Size; }

const misc::FloatInsets& CLayoutBox::GetInsets() const { return m_Widget ? m_Widget->GetInsets() : m_Insets; }

void CLayoutBox::SetMinSize(float width, float height)
{
    m_MinSize = {std::max(width, m_MinSize.X), std::max(height, m_MinSize.Y)};
    const FloatVector size = GetSize();
    if (size.X < m_MinSize.X || size.Y < m_MinSize.Y)
        SetBoxSize(size.X, size.Y);
}

void CLayoutBox::SetBoxSize(float width, float height)
{
    m_Size = {std::max(width, m_MinSize.X), std::max(height, m_MinSize.Y)};
    if (m_Widget) {
        // The widget may round or refuse: its size is the box's.
        m_Widget->SetSize(m_Size.X, m_Size.Y);
        m_Size = m_Widget->GetSize();
    } else {
        DistributeChildren();
    }
}

void CLayoutBox::DistributeChildren()
{
    if (m_Children.empty())
        return;
    const Sums sums = Sum([](const CLayoutBox& box) { return box.GetSize(); });
    const FloatVector size = GetSize();
    const misc::FloatInsets& insets = GetInsets();
    const FloatVector avail(size.X - insets.Left - insets.Right, size.Y - insets.Top - insets.Bottom);
    const bool stretch = m_Align == AlignStretch;
    for (const LayoutBoxPtrT& child : m_Children) {
        if (child->m_AbsPos)
            continue;
        const FloatVector present = child->GetSize();
        const float cross = stretch ? Cross(avail) : Cross(present);
        if (child->m_Flex > 0) {
            const float main = (Main(avail) - sums.fixed) * static_cast<float>(child->m_Flex) /
                               static_cast<float>(sums.flexSum);
            const FloatVector wanted = FromAxes(main, cross);
            child->SetBoxSize(wanted.X, wanted.Y);
        } else if (stretch) {
            const FloatVector wanted = FromAxes(Main(present), cross);
            child->SetBoxSize(wanted.X, wanted.Y);
        }
    }
}

void CLayoutBox::ApplyOffsets(float x, float y, bool isRoot)
{
    if (m_Widget && !isRoot) {
        m_Widget->SetOffset(x, y);
        x = y = 0; // what follows is relative to the widget
    }
    if (m_Children.empty())
        return;
    float sumMain = 0;
    for (const LayoutBoxPtrT& child : m_Children)
        if (!child->m_AbsPos)
            sumMain += Main(child->GetSize());
    const FloatVector size = GetSize();
    const misc::FloatInsets& insets = GetInsets();
    const FloatVector avail(size.X - insets.Left - insets.Right, size.Y - insets.Top - insets.Bottom);
    const float pack = PlacementFactor(m_Pack == PackCenter, m_Pack == PackEnd);
    const float align = PlacementFactor(m_Align == AlignCenter, m_Align == AlignEnd);
    // The running position along the main axis, from the start of the content.
    float main = (Main(avail) - sumMain) * pack;
    for (const LayoutBoxPtrT& child : m_Children) {
        if (child->m_AbsPos)
            continue;
        const FloatVector childSize = child->GetSize();
        const FloatVector at = FromAxes(main, (Cross(avail) - Cross(childSize)) * align);
        child->ApplyOffsets(x + insets.Left + at.X, y + insets.Top + at.Y, false);
        main += Main(childSize);
    }
}

bool CLayoutBox::RemoveBox(const CLayoutBox* box)
{
    for (auto it = m_Children.begin(); it != m_Children.end(); ++it) {
        if (it->get() == box) {
            m_Children.erase(it);
            return true;
        }
        if ((*it)->RemoveBox(box))
            return true;
    }
    return false;
}

} // namespace ox::gui

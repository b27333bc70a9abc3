#include "gui/controls/TableWidget.h"

#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "gui/Description.h"
#include "gui/LayoutBox.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/ScrollWidget.h"

#include <boost/make_shared.hpp>

#include <algorithm>
#include <cmath>
#include <numeric>

namespace ox::gui {

namespace {

constexpr int kMaxFlex = 1000;
constexpr float kScrollButtonValue = 35;
constexpr uint32_t kBackLayer = 1, kCellLayer = 2, kScrollLayer = 3;

// The grid's pieces in the strip of `lines_image`, from left to right.
enum LinePiece : int {
    PieceHorizontal, PieceVertical, PieceCross,
    PieceTeeDown, PieceTeeUp, PieceTeeRight, PieceTeeLeft,
    PieceTopLeft, PieceTopRight, PieceBottomLeft, PieceBottomRight,
    PieceTop, PieceBottom, PieceLeft, PieceRight,
};

misc::FloatVector ContentSize(const CWidget& widget)
{
    return widget.GetLayoutBox() ? widget.GetLayoutBox()->ComputePreferredSize() : widget.GetPreferredSize();
}

} // namespace

CTableWidget::CTableWidget() { AddFlags(FlagClipDraw); }

CTableWidget::~CTableWidget() = default;

void CTableWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "table_template");
    CWidget::Load(node, templates);
    m_DefaultBackImage = tmpl.GetValue("default_back_image");
    ReadImage(tmpl, "lines_image", m_LineImages);
    ReadChecked(node, "table_height", m_TableHeight, -1, 1 << 20);
    ReadFlag(node, "has_title", m_HasTitle);
    ReadFlag(node, "enable_selection", m_EnableSelection);
    m_SelectionBack = node.GetValue("selection_back");
    if (m_SelectionBack.empty())
        m_SelectionBack = tmpl.GetValue("default_selection_back");
    const std::string& scrollTemplate = tmpl.GetValue("scroll_template");
    if (!scrollTemplate.empty()) {
        core::CSettingsGroup scrollNode(misc::StringA88("scroll_widget"));
        scrollNode.AddValue("scroll_template", scrollTemplate.c_str());
        m_Scroll = new CScrollWidget(true);
        m_Scroll->Load(scrollNode, templates);
        m_Scroll->AddFlags(FlagHidden | FlagDisabled);
        m_Scroll->SetButtonValue(kScrollButtonValue);
        m_Scroll->SetLayer(kScrollLayer);
        AddWidget(m_Scroll);
    }
    m_Templates = boost::make_shared<core::CSettingsGroup>();
    templates.CopyTo(*m_Templates);
    for (const core::CSettingsGroup* row = node.GetChild("rows").GetFirstChildRef(); row; row = row->GetNextSiblingRef()) {
        auto copy = boost::make_shared<core::CSettingsGroup>();
        row->CopyTo(*copy);
        m_SourceRows.push_back(copy);
    }
    for (int i = 0; i < GetSourceRowsCount(); ++i)
        LoadRow(i);
    const FloatVector preferred = GetPreferredSize();
    SetSize(std::max(preferred.X, GetSize().X), std::max(preferred.Y, GetSize().Y));
}

// Rows and cells ---------------------------------------------------------------------------------

CTableWidget::Cell CTableWidget::MakeCell(const core::CSettingsGroup* element)
{
    Cell cell;
    cell.content = new CWidget();
    cell.back = new CImageWidget();
    if (element) {
        cell.content->Load(*element, *m_Templates);
        cell.content->UpdateLayout();
        ReadChecked(*element, "flex", cell.flex, 0, kMaxFlex);
        cell.backImage = element->GetValue("back_image");
    }
    if (cell.backImage.empty())
        cell.backImage = m_DefaultBackImage;
    cell.back->SetImage(cell.backImage.c_str());
    for (CWidget* part : {cell.content.get(), static_cast<CWidget*>(cell.back.get())}) {
        part->AddFlags(FlagHidden);
        part->SetLayer(part == cell.content.get() ? kCellLayer : kBackLayer);
        AddWidget(part);
    }
    return cell;
}

void CTableWidget::LoadRow(int index)
{
    OX_CHECK_DATA(index >= 0 && index < GetSourceRowsCount());
    std::vector<Cell> row;
    const core::CSettingsGroup& source = *m_SourceRows[static_cast<size_t>(index)];
    for (const core::CSettingsGroup* cell = source.GetFirstChildRef(); cell; cell = cell->GetNextSiblingRef())
        row.push_back(MakeCell(cell));
    m_Cells.push_back(std::move(row));
    ++m_Rows;
    m_Columns = std::max(m_Columns, static_cast<int>(m_Cells.back().size()));
    // Short rows are filled with empty cells.
    for (auto& cells : m_Cells)
        while (static_cast<int>(cells.size()) < m_Columns)
            cells.push_back(MakeCell(nullptr));
    if (m_SelectedRow == m_Rows - 1)
        SetRowBack(m_SelectedRow, m_SelectionBack);
}

CWidget* CTableWidget::GetCell(int row, int column) const
{
    if (row < 0 || row >= m_Rows || column < 0 || column >= m_Columns)
        return nullptr;
    return m_Cells[static_cast<size_t>(row)][static_cast<size_t>(column)].content.get();
}

void CTableWidget::ClearTable()
{
    for (const auto& row : m_Cells)
        for (const Cell& cell : row) {
            RemoveWidget(cell.content);
            RemoveWidget(cell.back.get());
        }
    m_Cells.clear();
    m_Rows = m_Columns = 0;
    m_SelectedRow = -1;
    m_ColumnWidths.clear();
    m_RowHeights.clear();
    m_ColumnFlex.clear();
    m_RowTops.assign(1, 0.0f);
    FitScroll();
}

float CTableWidget::GetColumnWidth(int column) const
{
    return column >= 0 && column < static_cast<int>(m_ColumnWidths.size()) ? m_ColumnWidths[static_cast<size_t>(column)]
                                                                          : 0;
}

float CTableWidget::GetRowHeight(int row) const
{
    return row >= 0 && row < static_cast<int>(m_RowHeights.size()) ? m_RowHeights[static_cast<size_t>(row)] : 0;
}

// Fitting ----------------------------------------------------------------------------------------

bool CTableWidget::IsScrolling() const { return m_Scroll && !(m_Scroll->GetFlags() & FlagDisabled); }

float CTableWidget::ScrollValue() const { return IsScrolling() ? m_Scroll->GetValue() : 0; }

float CTableWidget::TitleHeight() const { return m_HasTitle && m_Rows > 0 ? m_RowHeights[0] : 0; }

void CTableWidget::FitCells() { SetSize(GetSize().X, GetSize().Y); }

void CTableWidget::MeasureRows()
{
    m_RowHeights.assign(static_cast<size_t>(m_Rows), 0.0f);
    m_ColumnWidths.assign(static_cast<size_t>(m_Columns), 0.0f);
    m_ColumnFlex.assign(static_cast<size_t>(m_Columns), 0);
    for (size_t r = 0; r < m_Cells.size(); ++r)
        for (size_t c = 0; c < m_Cells[r].size(); ++c) {
            const FloatVector size = ContentSize(*m_Cells[r][c].content);
            m_RowHeights[r] = std::max(m_RowHeights[r], size.Y);
            m_ColumnWidths[c] = std::max(m_ColumnWidths[c], size.X);
            m_ColumnFlex[c] = std::max(m_ColumnFlex[c], m_Cells[r][c].flex);
        }
    m_RowTops.assign(1, 0.0f);
    for (float height : m_RowHeights)
        m_RowTops.push_back(m_RowTops.back() + height);
}

void CTableWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    MeasureRows();
    FitScroll();
    float w = width;
    if (IsScrolling())
        w -= m_Scroll->GetSize().X;
    float fixed = 0;
    int total = 0;
    for (size_t c = 0; c < m_ColumnWidths.size(); ++c) {
        if (m_ColumnFlex[c] == 0)
            fixed += m_ColumnWidths[c];
        total += m_ColumnFlex[c];
    }
    for (size_t c = 0; c < m_ColumnWidths.size(); ++c)
        if (m_ColumnFlex[c] > 0)
            m_ColumnWidths[c] = std::max(0.0f, static_cast<float>(m_ColumnFlex[c]) * (w - fixed) / static_cast<float>(total));
    for (size_t r = 0; r < m_Cells.size(); ++r)
        for (size_t c = 0; c < m_Cells[r].size(); ++c) {
            const Cell& cell = m_Cells[r][c];
            cell.content->SetSize(m_ColumnWidths[c], m_RowHeights[r]);
            cell.back->SetSize(m_ColumnWidths[c], m_RowHeights[r]);
            cell.content->RemFlags(FlagHidden);
            cell.back->RemFlags(FlagHidden);
        }
    PlaceCells();
}

void CTableWidget::FitScroll()
{
    if (!m_Scroll)
        return;
    if (m_Rows < 1 || m_Columns < 1 || m_TableHeight < 1 || m_Rows <= m_TableHeight) {
        m_Scroll->SetMaxValue(0);
        m_Scroll->SetPageSize(0);
        m_Scroll->AddFlags(FlagHidden | FlagDisabled);
        return;
    }
    const float title = TitleHeight();
    const float total = m_RowTops.back() - title, page = m_RowTops[static_cast<size_t>(m_TableHeight)] - title;
    m_Scroll->RemFlags(FlagHidden | FlagDisabled);
    m_Scroll->SetMaxValue(total);
    m_Scroll->SetPageSize(page);
    m_Scroll->SetMouseWheelK(page * 0.2f);
    m_Scroll->SetOffset(GetSize().X - m_Scroll->GetSize().X, title);
    m_Scroll->SetSize(m_Scroll->GetSize().X, std::max(0.0f, GetSize().Y - title));
}

misc::FloatVector CTableWidget::GetPreferredSize() const
{
    if (m_Rows == 0)
        return {};
    // Measured afresh: the fit may not have run since the last row came.
    float width = 0, height = 0;
    std::vector<float> widths(static_cast<size_t>(m_Columns), 0.0f);
    const int shown = m_TableHeight < 1 ? m_Rows : std::min(m_Rows, m_TableHeight);
    for (int r = 0; r < m_Rows; ++r) {
        float rowHeight = 0;
        for (size_t c = 0; c < widths.size(); ++c) {
            const FloatVector size = ContentSize(*m_Cells[static_cast<size_t>(r)][c].content);
            widths[c] = std::max(widths[c], size.X);
            rowHeight = std::max(rowHeight, size.Y);
        }
        if (r < shown)
            height += rowHeight;
    }
    width = std::accumulate(widths.begin(), widths.end(), 0.0f);
    if (m_Scroll && shown < m_Rows)
        width += m_Scroll->GetPreferredSize().X;
    return {width, height};
}

void CTableWidget::PlaceCells()
{
    const float v = ScrollValue();
    for (size_t r = 0; r < m_Cells.size(); ++r) {
        float x = 0;
        const float y = m_RowTops[r] - (m_HasTitle && r == 0 ? 0 : v);
        for (size_t c = 0; c < m_Cells[r].size(); ++c) {
            m_Cells[r][c].content->SetOffset(x, y);
            m_Cells[r][c].back->SetOffset(x, y);
            x += m_ColumnWidths[c];
        }
    }
}

void CTableWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    if (action == "value_changed" && m_Scroll && sender == m_Scroll.get())
        PlaceCells();
    CWidget::OnChildAction(action, sender);
}

// Selection and input ----------------------------------------------------------------------------

void CTableWidget::SetRowBack(int row, const std::string& image)
{
    for (const Cell& cell : m_Cells[static_cast<size_t>(row)])
        cell.back->SetImage((image.empty() ? cell.backImage : image).c_str());
}

void CTableWidget::SelectRow(int row)
{
    if (row < 0 || row >= m_Rows || row == m_SelectedRow || (m_HasTitle && row == 0))
        return;
    if (m_SelectedRow >= 0 && m_SelectedRow < m_Rows)
        SetRowBack(m_SelectedRow, {});
    SetRowBack(row, m_SelectionBack);
    m_SelectedRow = row;
    OnRowSelected();
}

void CTableWidget::OnRowSelected() { TellParent(*this, "row_selected"); }

bool CTableWidget::CellAt(const IntVector& pos, int& row, int& column) const
{
    const float x = static_cast<float>(pos.X), y = static_cast<float>(pos.Y), title = TitleHeight();
    if (m_Rows == 0 || x < 0 || y < 0)
        return false;
    const float rowY = m_HasTitle && y < title ? y : y + ScrollValue();
    if (rowY >= m_RowTops.back())
        return false;
    row = static_cast<int>(std::upper_bound(m_RowTops.begin(), m_RowTops.end(), rowY) - m_RowTops.begin()) - 1;
    float left = 0;
    for (column = 0; column < m_Columns; ++column) {
        left += m_ColumnWidths[static_cast<size_t>(column)];
        if (x < left)
            return true;
    }
    return false;
}

bool CTableWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    int row = 0, column = 0;
    if (!broadcast && m_EnableSelection && !(IsScrolling() && m_Scroll->ContainsPoint({static_cast<float>(pos.X),
                                                                                        static_cast<float>(pos.Y)})) &&
        CellAt(pos, row, column)) {
        WidgetPtrT self(this);
        SelectRow(row);
    }
    return CWidget::OnMouseDown(pos, button, keys, broadcast);
}

bool CTableWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    const bool handled = CWidget::OnDoubleClick(pos, keys, broadcast);
    int row = 0, column = 0;
    if (!broadcast && CellAt(pos, row, column) && !(m_HasTitle && row == 0)) {
        TellParent(*this, "table_double_click");
        return true;
    }
    return handled;
}

bool CTableWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (CWidget::OnMouseWheel(pos, delta, keys, broadcast))
        return true;
    if (!IsScrolling())
        return false;
    return m_Scroll->OnMouseWheel(pos, delta, keys, broadcast);
}

// Drawing ----------------------------------------------------------------------------------------

void CTableWidget::VisibleRows(int& first, int& end) const
{
    const float top = TitleHeight() + ScrollValue(), bottom = ScrollValue() + GetSize().Y;
    first = static_cast<int>(std::upper_bound(m_RowTops.begin(), m_RowTops.end(), top) - m_RowTops.begin()) - 1;
    first = std::max(first, m_HasTitle ? 1 : 0);
    end = static_cast<int>(std::lower_bound(m_RowTops.begin(), m_RowTops.end(), bottom) - m_RowTops.begin());
    end = std::min(end, m_Rows);
}

void CTableWidget::DrawRow(graphics::CRenderer& renderer, int row)
{
    for (const Cell& cell : m_Cells[static_cast<size_t>(row)]) {
        cell.back->Draw(renderer);
        cell.content->Draw(renderer);
    }
}

void CTableWidget::DrawPiece(graphics::CRenderer& renderer, int piece, float x, float y, float w, float h)
{
    const graphics::CTexture* lines = m_LineImages.GetTexture();
    misc::ShortRect source = StripPart(*lines, piece, kLinePieces);
    source.X = static_cast<int16_t>(source.X + 1);
    source.Width = static_cast<int16_t>(std::max(0, source.Width - 2));
    renderer.RenderTexture(lines, misc::FloatRect(x, y, w, h), source);
}

void CTableWidget::DrawGrid(graphics::CRenderer& renderer, int first, int end)
{
    const graphics::CTexture* lines = m_LineImages.GetTexture();
    if (!lines || first >= end)
        return;
    const float pw = static_cast<float>(lines->GetWidth()) / kLinePieces - 2;
    const float ph = static_cast<float>(lines->GetHeight());
    const float v = ScrollValue();
    std::vector<float> xs(1, 0.0f);
    for (float width : m_ColumnWidths)
        xs.push_back(xs.back() + width);
    const size_t lastX = xs.size() - 1;
    for (int r = first; r <= end; ++r) {
        const float y = m_RowTops[static_cast<size_t>(r)] - (m_HasTitle && r == 0 ? 0 : v);
        const bool top = r == 0, bottom = r == m_Rows;
        // The separator below the rows, then the column lines down the row.
        for (size_t c = 0; c < lastX; ++c)
            DrawPiece(renderer, top ? PieceTop : bottom ? PieceBottom : PieceHorizontal, xs[c] + pw / 2, y - ph / 2,
                      xs[c + 1] - xs[c] - pw, ph);
        if (r < end) {
            const float h = m_RowHeights[static_cast<size_t>(r)];
            for (size_t c = 0; c <= lastX; ++c)
                DrawPiece(renderer, c == 0 ? PieceLeft : c == lastX ? PieceRight : PieceVertical, xs[c] - pw / 2,
                          y + ph / 2, pw, h - ph);
        }
        for (size_t c = 0; c <= lastX; ++c) {
            const bool left = c == 0, right = c == lastX;
            const int piece = top    ? (left ? PieceTopLeft : right ? PieceTopRight : PieceTeeDown)
                              : bottom ? (left ? PieceBottomLeft : right ? PieceBottomRight : PieceTeeUp)
                              : left   ? PieceTeeRight
                              : right  ? PieceTeeLeft
                                       : PieceCross;
            DrawPiece(renderer, piece, xs[c] - pw / 2, y - ph / 2, pw, ph);
        }
    }
}

void CTableWidget::DoDraw(graphics::CRenderer& renderer)
{
    // The cells are drawn here, only those in view; the base would draw them all.
    if (m_Rows > 0) {
        const float title = TitleHeight();
        if (m_HasTitle) {
            DrawRow(renderer, 0);
            DrawGrid(renderer, 0, 1);
        }
        renderer.PushState();
        renderer.SetClipPoly(misc::RectToPoly4({0, title, GetSize().X, GetSize().Y - title}));
        int first = 0, end = 0;
        VisibleRows(first, end);
        for (int r = end - 1; r >= first; --r)
            DrawRow(renderer, r);
        DrawGrid(renderer, first, end);
        renderer.PopState();
    }
    if (m_Scroll && !(m_Scroll->GetFlags() & FlagHidden))
        m_Scroll->Draw(renderer);
}

} // namespace ox::gui

#pragma once
// A grid of cell widgets over back images. Each `row` of the description gives a row, each of
// its `cell`s a plain widget holding what the cell's element describes; rows are as high as
// their tallest cell, columns as wide as their widest, and columns with a `flex` share what
// the fixed ones leave. Row 0 may be a title that stays put while the others scroll under
// it. A press selects a row ("row_selected"), a double click tells "table_double_click".
#include "core/Settings.h"
#include "graphics/Image.h"
#include "gui/Widget.h"

#include <boost/shared_ptr.hpp>

#include <string>
#include <vector>

namespace ox::gui {

class CImageWidget;
class CScrollWidget;

class CTableWidget : public CWidget {
public:
    struct Cell {
        WidgetPtrT content;
        boost::intrusive_ptr<CImageWidget> back;
        std::string backImage;
        int flex = 0;
    };
    static constexpr int kLinePieces = 15;

    CTableWidget();
    ~CTableWidget() override;

    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    bool ReadsChildElement(std::string_view element) const override { return element == "rows"; }
    // Shares the width among the columns, sizes and places every cell.
    void SetSize(float width, float height) override;
    // The columns' widths by the rows shown at a time, with the bar when it shows.
    FloatVector GetPreferredSize() const override;
    void DoDraw(graphics::CRenderer& renderer) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;
    void OnChildAction(const std::string& action, CWidget* sender) override;

    // The content of a cell; null out of range or where a short row has none of its own.
    CWidget* GetCell(int row, int column) const;
    // Appends a row made from source row `index` of the description.
    void LoadRow(int index);
    // SetSize at the present size.
    void FitCells();
    int GetCellsCount() const { return m_Rows * m_Columns; }
    int GetRowsCount() const { return m_Rows; }
    int GetColumnsCount() const { return m_Columns; }
    int GetSourceRowsCount() const { return static_cast<int>(m_SourceRows.size()); }
    // Removes every cell; LoadRow fills the table again.
    void ClearTable();
    void SelectRow(int row);
    int GetSelectedRow() const { return m_SelectedRow; }
    CScrollWidget* GetScroll() const { return m_Scroll.get(); }
    const std::vector<std::vector<Cell>>& GetCells() const { return m_Cells; }
    float GetColumnWidth(int column) const;
    float GetRowHeight(int row) const;

    // "row_selected" to the parent.
    virtual void OnRowSelected();

private:
    bool IsScrolling() const;
    float ScrollValue() const;
    float TitleHeight() const;
    // Sums of the row heights: the top of row r is m_RowTops[r].
    void MeasureRows();
    void FitScroll();
    void PlaceCells();
    // The row and column under a point of the widget; false outside every cell.
    bool CellAt(const IntVector& pos, int& row, int& column) const;
    // The rows that reach into the body between its top and bottom, as a half-open range.
    void VisibleRows(int& first, int& end) const;
    void DrawRow(graphics::CRenderer& renderer, int row);
    void DrawGrid(graphics::CRenderer& renderer, int first, int end);
    void DrawPiece(graphics::CRenderer& renderer, int piece, float x, float y, float w, float h);
    void SetRowBack(int row, const std::string& image);
    Cell MakeCell(const core::CSettingsGroup* element);

    int m_Columns = 0;
    int m_Rows = 0;
    std::vector<std::vector<Cell>> m_Cells;
    int m_TableHeight = 0;
    bool m_HasTitle = false;
    bool m_EnableSelection = false;
    std::string m_SelectionBack;
    std::string m_DefaultBackImage;
    int m_SelectedRow = -1;
    // A strip of the grid's pieces.
    graphics::CImage m_LineImages;
    boost::intrusive_ptr<CScrollWidget> m_Scroll;
    std::vector<float> m_ColumnWidths;
    std::vector<float> m_RowHeights;
    std::vector<int> m_ColumnFlex;
    std::vector<float> m_RowTops;
    std::vector<boost::shared_ptr<core::CSettingsGroup>> m_SourceRows;
    boost::shared_ptr<core::CSettingsGroup> m_Templates;
};

} // namespace ox::gui

#pragma once
// An invisible clickable contour of a scene: a closed polygon of points, any shape. The
// game draws it only when the level shows areas; it takes clicks whether drawn or not.
#include "misc/GenericIterator.h"
#include "quest/SceneObject.h"

#include <utility>
#include <vector>

namespace qe {

class CAreaPoint : public ox::misc::CRefCountedObj {
public:
    CAreaPoint() = default;
    explicit CAreaPoint(const FloatVector& pos) : m_Pos(pos) {}
    FloatVector GetPos() const { return m_Pos; }
    void SetPos(const FloatVector& pos) { m_Pos = pos; }

private:
    FloatVector m_Pos;
};

using AreaPointPtrT = boost::intrusive_ptr<CAreaPoint>;

class CArea : public CSceneObject {
public:
    using PointsListT = std::vector<AreaPointPtrT>;
    using PointIteratorT = ox::misc::CGenericIterator<PointsListT>;

    // The mean of the points; (0, 0) without any.
    FloatVector GetPos() const override;
    // The contour in yellow with a white square on each point, in scene coordinates.
    void Draw(ox::graphics::CRenderer* renderer) override;
    // Inside the contour by the crossings of a horizontal ray on either side of the point.
    bool IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const override;
    BaseSceneObjectPtrT Clone() const override;
    // Unless brief, the points become those of the `point` children.
    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

    // Behind `after`, or first when it is null or not a point of the contour.
    void InsertPoint(AreaPointPtrT point, const CAreaPoint* after);
    // Removes the first occurrence; an unknown point is ignored.
    void RemovePoint(const CAreaPoint* point);
    unsigned EnumPoints() const { return static_cast<unsigned>(m_Points.size()); }
    PointIteratorT GetPoints() { return PointIteratorT(&m_Points); }
    const PointsListT& Points() const { return m_Points; }
    void UpdatePosition() {}

    // Some point lies nearer than 6 to `point`.
    bool PointIsNearToContour(const FloatVector& point) const;
    // For an editing tool: (false, a point nearer than 6), or (true, the point behind which
    // one is to be inserted on an edge nearer than 6), or (false, null). A point wins over an
    // edge; the closing edge is never a candidate.
    std::pair<bool, CAreaPoint*> GetNearestPoint(const FloatVector& point) const;

    // Three points at least, enclosing some area: what can be drawn and clicked. The first
    // test that finds otherwise after a change of points logs it, naming the area.
    bool IsUsable() const;

protected:
    bool HasEditorFrame() const override { return false; }
    const char* XmlName() const override { return "area"; }
    void SaveChildren(ox::misc::CXmlElement& element, bool brief) const override;

private:
    PointsListT m_Points;
    mutable bool m_Reported = false;
};

using AreaPtrT = boost::intrusive_ptr<CArea>;

} // namespace qe

#pragma once
// A curve of cubic Bezier segments whose points are given relative to a quadrilateral (the
// location's contour): moving or reshaping the contour moves the curve. A point on it is
// found by a coefficient k from 0 to 1 measured in arc length, through 16 chords sampled
// per segment whenever the points change.
#include "graphics/Color.h"
#include "misc/Location.h"
#include "misc/Rect.h"
#include "misc/animation/ClipFormat.h"

#include <list>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::misc::anim {

struct PathSegment {
    static constexpr int kChords = 16;
    const PathPoint* first = nullptr;
    const PathPoint* second = nullptr;
    // The curve at Bezier parameter i/16, i = 1..15, relative to the contour.
    FloatVector samples[kChords - 1];
    // Distances along the chords to each sample, then the whole length, in source units.
    float distances[kChords] = {};

    float Length() const { return distances[kChords - 1]; }
};

class CPath {
public:
    CPath();
    CPath(const CPath& other);
    CPath& operator=(const CPath& other);

    // Appends a point; one whose anchor lies outside 0..1 is refused without a word.
    void AddPoint(const PathPoint& point);
    void SetClosed(bool closed);
    bool IsClosed() const { return m_Closed; }

    // The point at a coefficient (clamped to 0..1); the first anchor when the path has no
    // length, (-1, -1) when it has no segment to walk.
    FloatVector GetPosByCoef(float k) const;
    // The coefficient of the path's point nearest to `pos`; `offset` gets that point minus
    // pos. 0 without segments. Of points at equal distance the earlier along the path wins.
    float GetCoefByPos(const FloatVector& pos, FloatVector& offset) const;
    const PathSegment* GetSegmentByCoef(float k) const;
    // The anchor nearest to `pos` of the segment nearest to it; `offset` gets pos minus it.
    const PathPoint* GetNearestPoint(const FloatVector& pos, FloatVector& offset) const;

    // Editing: each ends by fitting the contour round the curve.
    const PathPoint* InsertPoint(float k);
    void RemovePoint(const PathPoint* point);
    void UpdatePoint(const PathPoint* point, const PathPoint& value);
    void Clear();

    const Location& GetLocation() const { return m_Location; }
    // Lengths stay as measured: coefficients are ratios and hold for the new place.
    void SetLocation(const Location& location)
    {
        m_Location = location;
        m_Poly = location.GetPoly();
    }
    float GetLength() const { return m_Length; }
    FloatRect GetBoundingRect() const;
    size_t EnumPoints() const { return m_Points.size(); }
    const std::list<PathPoint>& GetPoints() const { return m_Points; }
    const std::vector<PathSegment>& GetSegments() const { return m_Segments; }

    // The chords as lines and a 4 by 4 square round each anchor.
    void Draw(graphics::CRenderer& renderer, const graphics::Color& color) const;

    // The curve of a segment at Bezier parameter t, in source units.
    FloatVector CurvePos(const PathSegment& segment, float t) const;
    FloatVector Abs(const FloatVector& rel) const;
    FloatVector Rel(const FloatVector& abs) const;

private:
    PathSegment MakeSegment(const PathPoint* first, const PathPoint* second) const;
    void SumLength();
    // Segments between neighbours in the point order, and the closing one when closed.
    void LinkSegments();
    // The contour becomes the bounding rectangle of the curve, the points follow it.
    void Fit();
    // The segment holding `target` source units from the start; `before` gets the length of
    // the segments ahead of it.
    const PathSegment* FindSegment(float target, float& before) const;
    PathPoint* Editable(const PathPoint* point);

    std::list<PathPoint> m_Points;
    std::vector<PathSegment> m_Segments;
    bool m_Closed = true;
    float m_Length = 0;
    Location m_Location;
    Poly4 m_Poly;  // the location's contour in source units
};

} // namespace ox::misc::anim

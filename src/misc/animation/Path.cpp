#include "misc/animation/Path.h"

#include "diag/Assert.h"
#include "graphics/Renderer.h"

#include <algorithm>
#include <cmath>
#include <map>

namespace ox::misc::anim {

namespace {

float Distance(const FloatVector& a, const FloatVector& b) { return std::hypot(b.X - a.X, b.Y - a.Y); }

FloatVector Bezier(const FloatVector& p0, const FloatVector& p1, const FloatVector& p2, const FloatVector& p3, float t)
{
    const float u = 1 - t;
    return p0 * (u * u * u) + p1 * (3 * u * u * t) + p2 * (3 * u * t * t) + p3 * (t * t * t);
}

// The point of the chord a-b nearest to p: the foot of the perpendicular when it lies on
// the chord, else the nearer end.
FloatVector NearestOnChord(const FloatVector& a, const FloatVector& b, const FloatVector& p)
{
    const FloatVector d = b - a;
    const float length2 = d.X * d.X + d.Y * d.Y;
    const float t = length2 > 0 ? ((p.X - a.X) * d.X + (p.Y - a.Y) * d.Y) / length2 : 0.0f;
    if (t >= 0 && t <= 1)
        return a + d * t;
    return Distance(a, p) <= Distance(b, p) ? a : b;
}

float ClampCoef(float k) { return k >= 0 ? std::min(k, 1.0f) : 0.0f; }  // NaN becomes 0

} // namespace

CPath::CPath() { SetLocation({{0, 0}, RectToPoly4({0, 0, 1, 1}), 0}); }

CPath::CPath(const CPath& other) { *this = other; }

CPath& CPath::operator=(const CPath& other)
{
    if (this == &other)
        return *this;
    m_Points = other.m_Points;
    m_Segments = other.m_Segments;
    m_Closed = other.m_Closed;
    m_Length = other.m_Length;
    SetLocation(other.m_Location);
    // The segments point at the copied points.
    std::map<const PathPoint*, const PathPoint*> moved;
    auto mine = m_Points.begin();
    for (const PathPoint& point : other.m_Points)
        moved[&point] = &*mine++;
    for (PathSegment& segment : m_Segments) {
        segment.first = moved[segment.first];
        segment.second = moved[segment.second];
    }
    return *this;
}

FloatVector CPath::Abs(const FloatVector& rel) const { return Poly4ConvertToAbsPos(m_Poly, rel); }

FloatVector CPath::Rel(const FloatVector& abs) const { return Poly4ConvertToLocalPos(m_Poly, abs); }

FloatVector CPath::CurvePos(const PathSegment& segment, float t) const
{
    return Bezier(Abs(segment.first->a), Abs(segment.first->p1), Abs(segment.second->p2), Abs(segment.second->a), t);
}

PathSegment CPath::MakeSegment(const PathPoint* first, const PathPoint* second) const
{
    PathSegment segment;
    segment.first = first;
    segment.second = second;
    FloatVector previous = Abs(first->a);
    float acc = 0;
    for (int i = 1; i < PathSegment::kChords; ++i) {
        const FloatVector p = CurvePos(segment, static_cast<float>(i) / PathSegment::kChords);
        acc += Distance(previous, p);
        segment.samples[i - 1] = Rel(p);
        segment.distances[i - 1] = acc;
        previous = p;
    }
    segment.distances[PathSegment::kChords - 1] = acc + Distance(previous, Abs(second->a));
    return segment;
}

void CPath::SumLength()
{
    m_Length = 0;
    for (const PathSegment& segment : m_Segments)
        m_Length += segment.Length();
}

void CPath::LinkSegments()
{
    m_Segments.clear();
    for (auto it = m_Points.begin(); it != m_Points.end() && std::next(it) != m_Points.end(); ++it)
        m_Segments.push_back(MakeSegment(&*it, &*std::next(it)));
    if (m_Closed && m_Points.size() > 1)
        m_Segments.push_back(MakeSegment(&m_Points.back(), &m_Points.front()));
}

void CPath::AddPoint(const PathPoint& point)
{
    if (!(point.a.X >= 0 && point.a.X <= 1 && point.a.Y >= 0 && point.a.Y <= 1))
        return;
    m_Points.push_back(point);
    if (m_Points.size() >= 2) {
        if (m_Closed && !m_Segments.empty())
            m_Segments.pop_back();
        const PathPoint* last = &m_Points.back();
        m_Segments.push_back(MakeSegment(&*std::prev(m_Points.end(), 2), last));
        if (m_Closed)
            m_Segments.push_back(MakeSegment(last, &m_Points.front()));
    }
    SumLength();
}

void CPath::SetClosed(bool closed)
{
    if (closed == m_Closed)
        return;
    m_Closed = closed;
    if (!closed && !m_Segments.empty()) {
        m_Segments.pop_back();
        Fit();
    } else if (closed && m_Points.size() > 1) {
        m_Segments.push_back(MakeSegment(&m_Points.back(), &m_Points.front()));
        Fit();
    }
}

FloatRect CPath::GetBoundingRect() const
{
    if (m_Points.empty())
        return {};
    FloatVector low = Abs(m_Points.front().a), high = low;
    auto take = [&](const FloatVector& p) {
        low = {std::min(low.X, p.X), std::min(low.Y, p.Y)};
        high = {std::max(high.X, p.X), std::max(high.Y, p.Y)};
    };
    for (const PathPoint& point : m_Points)
        take(Abs(point.a));
    for (const PathSegment& segment : m_Segments)
        for (const FloatVector& sample : segment.samples)
            take(Abs(sample));
    return {low.X, low.Y, high.X - low.X, high.Y - low.Y};
}

void CPath::Fit()
{
    const FloatRect r = GetBoundingRect();
    if (std::fabs(r.Width) >= 0.001f && std::fabs(r.Height) >= 0.001f) {
        auto refit = [&](FloatVector& v) {
            const FloatVector world = Abs(v);
            v = {(world.X - r.X) / r.Width, (world.Y - r.Y) / r.Height};
        };
        for (PathPoint& point : m_Points) {
            refit(point.p1);
            refit(point.p2);
            refit(point.a);
        }
        const FloatVector centre(r.X + r.Width / 2, r.Y + r.Height / 2);
        SetLocation({centre, RectToPoly4({-r.Width / 2, -r.Height / 2, r.Width, r.Height}), 0});
    }
    for (PathSegment& segment : m_Segments)
        segment = MakeSegment(segment.first, segment.second);
    SumLength();
}

const PathSegment* CPath::FindSegment(float target, float& before) const
{
    float sum = 0;
    for (const PathSegment& segment : m_Segments) {
        if (target <= sum + segment.Length()) {
            before = sum;
            return &segment;
        }
        sum += segment.Length();
    }
    return nullptr;
}

const PathSegment* CPath::GetSegmentByCoef(float k) const
{
    float before = 0;
    return FindSegment(ClampCoef(k) * m_Length, before);
}

FloatVector CPath::GetPosByCoef(float k) const
{
    if (m_Segments.empty())
        return {-1, -1};
    if (!(m_Length > 0))
        return Abs(m_Segments.front().first->a);
    float before = 0;
    float target = ClampCoef(k) * m_Length;
    const PathSegment* segment = FindSegment(target, before);
    if (!segment)
        return {-1, -1};
    target -= before;
    for (int i = 0; i < PathSegment::kChords; ++i) {
        const float end = segment->distances[i];
        if (target > end + 0.001f)
            continue;
        const float base = i > 0 ? segment->distances[i - 1] : 0.0f;
        // A chord of no length (coincident points) stands for its start.
        const float part = end > base ? (target - base) / (end - base) : 0.0f;
        return CurvePos(*segment, std::clamp((part + i) / PathSegment::kChords, 0.0f, 1.0f));
    }
    return {-1, -1};
}

float CPath::GetCoefByPos(const FloatVector& pos, FloatVector& offset) const
{
    if (m_Segments.empty())
        return 0;
    const FloatVector start = Abs(m_Segments.front().first->a);
    offset = start - pos;
    if (!(m_Length > 0))
        return 0;
    float best = Distance(start, pos), k = 0, before = 0;
    for (const PathSegment& segment : m_Segments) {
        FloatVector a = Abs(segment.first->a);
        for (int i = 0; i < PathSegment::kChords; ++i) {
            const FloatVector b = i + 1 < PathSegment::kChords ? Abs(segment.samples[i]) : Abs(segment.second->a);
            const FloatVector q = NearestOnChord(a, b, pos);
            const float distance = Distance(q, pos);
            if (distance < best) {
                best = distance;
                offset = q - pos;
                // Along the chord in the measured units, which a later change of place leaves as they were.
                const float start = i > 0 ? segment.distances[i - 1] : 0.0f, chord = Distance(a, b);
                const float along = chord > 0 ? Distance(q, a) / chord * (segment.distances[i] - start) : 0.0f;
                k = (before + start + along) / m_Length;
            }
            a = b;
        }
        before += segment.Length();
    }
    return k;
}

const PathPoint* CPath::GetNearestPoint(const FloatVector& pos, FloatVector& offset) const
{
    if (m_Segments.empty()) {
        if (m_Points.empty())
            return nullptr;
        offset = pos - Abs(m_Points.front().a);
        return &m_Points.front();
    }
    FloatVector unused;
    const PathSegment* segment = GetSegmentByCoef(GetCoefByPos(pos, unused));
    if (!segment)
        segment = &m_Segments.front();
    const FloatVector a = Abs(segment->first->a), b = Abs(segment->second->a);
    const bool first = Distance(a, pos) < Distance(b, pos);
    offset = pos - (first ? a : b);
    return first ? segment->first : segment->second;
}

PathPoint* CPath::Editable(const PathPoint* point)
{
    for (PathPoint& mine : m_Points)
        if (&mine == point)
            return &mine;
    return nullptr;
}

const PathPoint* CPath::InsertPoint(float k)
{
    OX_CHECK_DATA(k >= 0.f && k <= 1.f && !m_Segments.empty(), nullptr);
    OX_CHECK_DATA(m_Length > 0.f, nullptr);
    const FloatVector q = GetPosByCoef(k);
    float before = 0;
    const float target = k * m_Length;
    const PathSegment* segment = FindSegment(target, before);
    if (!segment)
        return nullptr;
    const float f = segment->Length() > 0 ? (target - before) / segment->Length() : 0.0f;
    PathPoint* first = Editable(segment->first);
    PathPoint* second = Editable(segment->second);
    // The control arms shrink to the part of the segment each side keeps.
    const FloatVector a = Abs(first->a), b = Abs(second->a);
    first->p1 = Rel(a + (Abs(first->p1) - a) * f);
    second->p2 = Rel(b + (Abs(second->p2) - b) * (1 - f));
    const FloatVector r = Rel(q);
    auto place = std::find_if(m_Points.begin(), m_Points.end(), [&](const PathPoint& p) { return &p == second; });
    // On the closing segment the new point ends the list.
    if (place == m_Points.begin())
        place = m_Points.end();
    const PathPoint* inserted = &*m_Points.insert(place, PathPoint {r, r, r});
    LinkSegments();
    Fit();
    return inserted;
}

void CPath::RemovePoint(const PathPoint* point)
{
    auto it = std::find_if(m_Points.begin(), m_Points.end(), [&](const PathPoint& p) { return &p == point; });
    if (it == m_Points.end())
        return;
    m_Points.erase(it);
    LinkSegments();
    Fit();
}

void CPath::UpdatePoint(const PathPoint* point, const PathPoint& value)
{
    if (PathPoint* mine = Editable(point)) {
        *mine = value;
        Fit();
    }
}

void CPath::Clear()
{
    m_Points.clear();
    m_Segments.clear();
    m_Length = 0;
}

void CPath::Draw(graphics::CRenderer& renderer, const graphics::Color& color) const
{
    for (const PathSegment& segment : m_Segments) {
        FloatVector a = Abs(segment.first->a);
        for (int i = 0; i < PathSegment::kChords; ++i) {
            const FloatVector b = i + 1 < PathSegment::kChords ? Abs(segment.samples[i]) : Abs(segment.second->a);
            renderer.RenderLine(a, b, color);
            a = b;
        }
    }
    for (const PathPoint& point : m_Points) {
        const FloatVector a = Abs(point.a);
        renderer.RenderRect({a.X - 2, a.Y - 2, 4, 4}, color);
    }
}

} // namespace ox::misc::anim

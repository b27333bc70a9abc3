#include "quest/Area.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "quest/TreeEdit.h"

#include <algorithm>
#include <cmath>

namespace qe {

namespace {

constexpr const char* kChannel = "quest";
constexpr float kNear = 6.0f;
constexpr float kRayHalfLength = 10000.0f;

float Distance(const FloatVector& a, const FloatVector& b) { return std::hypot(a.X - b.X, a.Y - b.Y); }

// The foot of the perpendicular from `point` on the line through p and q.
FloatVector Foot(const FloatVector& point, const FloatVector& p, const FloatVector& q)
{
    const FloatVector d = q - p;
    if (std::fabs(d.X) < 0.001f)
        return {p.X, point.Y};
    if (std::fabs(d.Y) < 0.001f)
        return {point.X, p.Y};
    const float t = ((point.X - p.X) * d.X + (point.Y - p.Y) * d.Y) / (d.X * d.X + d.Y * d.Y);
    return p + d * t;
}

} // namespace

FloatVector CArea::GetPos() const
{
    FloatVector sum;
    for (const AreaPointPtrT& point : m_Points)
        sum += point->GetPos();
    return m_Points.empty() ? sum : sum * (1.0f / m_Points.size());
}

bool CArea::IsUsable() const
{
    float twiceArea = 0;
    for (size_t i = 0, n = m_Points.size(); i < n; ++i) {
        const FloatVector p = m_Points[i]->GetPos(), q = m_Points[(i + 1) % n]->GetPos();
        twiceArea += p.X * q.Y - q.X * p.Y;
    }
    const bool usable = m_Points.size() >= 3 && std::fabs(twiceArea) > 1e-6f;
    if (!usable && !m_Reported)
        OX_LOG(kChannel, ox::diag::LogError,
               "Area '%s': a contour of %zu points with no area inside; it draws nothing and takes no click",
               GetIdRef().c_str(), m_Points.size());
    m_Reported = !usable;
    return usable;
}

void CArea::Draw(ox::graphics::CRenderer* renderer)
{
    if (!IsUsable())
        return;
    for (size_t i = 0, n = m_Points.size(); i < n; ++i) {
        const FloatVector p = m_Points[i]->GetPos();
        renderer->RenderLine(p, m_Points[(i + 1) % n]->GetPos(), Color(0xFFFFFF00u));
        renderer->RenderFilledPoly4(ox::misc::RectToPoly4({p.X - 3, p.Y - 3, 6, 6}), Color(0xFFFFFFFFu));
    }
}

bool CArea::IsContains(const FloatVector& point, const ox::core::CTexturesAlpha*) const
{
    if (!IsUsable())
        return false;
    int left = 0, right = 0;
    for (size_t i = 0, n = m_Points.size(); i < n; ++i) {
        const FloatVector p = m_Points[i]->GetPos(), q = m_Points[(i + 1) % n]->GetPos();
        const FloatVector prev = m_Points[(i + n - 1) % n]->GetPos();
        // An edge along the ray, or parallel to it, has no crossing.
        if (p.Y == q.Y)
            continue;
        const float t = (point.Y - p.Y) / (q.Y - p.Y);
        const FloatVector crossing {p.X + t * (q.X - p.X), point.Y};
        bool counts;
        if (crossing.Y == p.Y)
            // Through vertex p: a crossing only where the contour passes the line there.
            counts = (q.Y - crossing.Y) * (prev.Y - crossing.Y) < 0;
        else
            // Strictly inside both the edge and the ray; the end at q is the next edge's.
            counts = t > 0 && t < 1 && std::fabs(crossing.X - point.X) < kRayHalfLength && crossing.Y != q.Y;
        if (!counts)
            continue;
        if (crossing.X == point.X)
            return true;
        ++(crossing.X > point.X ? right : left);
    }
    return left % 2 == 1 && right % 2 == 1;
}

BaseSceneObjectPtrT CArea::Clone() const
{
    AreaPtrT clone(new CArea());
    CopyTo(*clone);
    for (const AreaPointPtrT& point : m_Points)
        clone->m_Points.emplace_back(new CAreaPoint(point->GetPos()));
    return clone;
}

void CArea::InsertPoint(AreaPointPtrT point, const CAreaPoint* after)
{
    OX_CHECK_DATA(point);
    InsertBehind(m_Points, std::move(point), after);
    m_Reported = false;
}

void CArea::RemovePoint(const CAreaPoint* point)
{
    auto found = std::find_if(m_Points.begin(), m_Points.end(), [point](const auto& p) { return p.get() == point; });
    if (found == m_Points.end())
        return;
    m_Points.erase(found);
    m_Reported = false;
}

bool CArea::PointIsNearToContour(const FloatVector& point) const
{
    return std::any_of(m_Points.begin(), m_Points.end(),
                       [&point](const AreaPointPtrT& p) { return Distance(p->GetPos(), point) < kNear; });
}

std::pair<bool, CAreaPoint*> CArea::GetNearestPoint(const FloatVector& point) const
{
    CAreaPoint* candidate = nullptr;
    for (size_t i = 0, n = m_Points.size(); i < n; ++i) {
        const FloatVector p = m_Points[i]->GetPos(), q = m_Points[(i + 1) % n]->GetPos();
        if (Distance(point, p) < kNear)
            return {false, m_Points[i].get()};
        if (candidate)
            return {true, candidate};
        const FloatVector foot = Foot(point, p, q);
        const float length = Distance(q, p);
        if (Distance(foot, p) < length && Distance(foot, q) < length && Distance(point, foot) < kNear)
            candidate = m_Points[i].get();
    }
    return {false, nullptr};
}

} // namespace qe

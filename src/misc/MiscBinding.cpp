#include "misc/MiscBinding.h"

#include "diag/Message.h"
#include "lua/mluabind/StdBinding.h"
#include "misc/Location.h"
#include "misc/Matrix.h"
#include "misc/Rect.h"
#include "misc/String.h"
#include "misc/StringTable.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Clipboard.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace ox::misc {

namespace {

using mluabind::Class;
using mluabind::Function;
using BoolFloatPair = std::pair<bool, float>;

float Cross(const FloatVector& a, const FloatVector& b) { return a.X * b.Y - a.Y * b.X; }

// The foot of the perpendicular from `p` on the line through `a` and `b` (a itself when the
// two are one point); true when it lies between them.
bool GetOrthogonalPos(const FloatVector& a, const FloatVector& b, const FloatVector& p, FloatVector& foot)
{
    const FloatVector d = b - a;
    const float length2 = d.X * d.X + d.Y * d.Y;
    const float t = length2 > 0 ? ((p.X - a.X) * d.X + (p.Y - a.Y) * d.Y) / length2 : 0.0f;
    foot = a + d * t;
    return t >= 0 && t <= 1;
}

// Whether the lines through a1-a2 and b1-b2 meet, and where along the first (0 at a1, 1 at a2).
BoolFloatPair GetLinesIntersect(const FloatVector& a1, const FloatVector& a2, const FloatVector& b1,
                                const FloatVector& b2)
{
    const FloatVector r = a2 - a1, s = b2 - b1;
    const float denominator = Cross(r, s);
    if (std::fabs(denominator) < 1e-12f)
        return {false, 0.0f};
    return {true, Cross(b1 - a1, s) / denominator};
}

bool SegmentsCross(const FloatVector& a1, const FloatVector& a2, const FloatVector& b1, const FloatVector& b2)
{
    const BoolFloatPair onA = GetLinesIntersect(a1, a2, b1, b2);
    const BoolFloatPair onB = GetLinesIntersect(b1, b2, a1, a2);
    return onA.first && onA.second >= 0 && onA.second <= 1 && onB.second >= 0 && onB.second <= 1;
}

// The cubic curve from p0 to p3 with the handles p1 and p2, at t from 0 to 1.
FloatVector GetBezierPos(const FloatVector& p0, const FloatVector& p1, const FloatVector& p2, const FloatVector& p3,
                         float t)
{
    const float u = 1 - t;
    return p0 * (u * u * u) + p1 * (3 * u * u * t) + p2 * (3 * u * t * t) + p3 * (t * t * t);
}

float GetAngle(const FloatVector& v) { return std::atan2(v.Y, v.X); }
float CalculateFloatVectorModule(const FloatVector& v) { return std::sqrt(v.X * v.X + v.Y * v.Y); }

FloatRect GetBoundingRect(const Poly4& poly)
{
    float left = poly[0].X, right = left, top = poly[0].Y, bottom = top;
    for (int i = 1; i < 4; ++i) {
        left = std::min(left, poly[i].X);
        right = std::max(right, poly[i].X);
        top = std::min(top, poly[i].Y);
        bottom = std::max(bottom, poly[i].Y);
    }
    return {left, top, right - left, bottom - top};
}

// Two quads meet when an edge of one crosses an edge of the other or one holds the other.
bool IsIntersects(const Poly4& a, const Poly4& b)
{
    for (int i = 0; i < 4; ++i)
        for (int j = 0; j < 4; ++j)
            if (SegmentsCross(a[i], a[(i + 1) % 4], b[j], b[(j + 1) % 4]))
                return true;
    return IsPointInPoly4(a, b[0]) || IsPointInPoly4(b, a[0]);
}

void ScalePoly(Poly4& poly, float k)
{
    for (int i = 0; i < 4; ++i)
        poly[i] = poly[i] * k;
}

Poly4 Poly4FromPoints(const FloatVector& p0, const FloatVector& p1, const FloatVector& p2, const FloatVector& p3)
{
    Poly4 poly;
    poly[0] = p0, poly[1] = p1, poly[2] = p2, poly[3] = p3;
    return poly;
}

// Turning or scaling about a point: move it to the origin, apply, move back.
FloatMatrix AboutPoint(const FloatMatrix& m, const FloatVector& c)
{
    return MatrixTranslation(-c.X, -c.Y) * m * MatrixTranslation(c.X, c.Y);
}

mluabind::Namespace GeometryClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<FloatVector>("FloatVector")
                    .Constructor<>()
                    .Constructor<float, float>()
                    .Member("X", &FloatVector::X)
                    .Member("Y", &FloatVector::Y));
    ns.AddClass(Class<IntVector>("IntVector")
                    .Constructor<>()
                    .Constructor<int, int>()
                    .Member("X", &IntVector::X)
                    .Member("Y", &IntVector::Y));
    ns.AddClass(Class<FloatRect>("FloatRect")
                    .Constructor<>()
                    .Constructor<float, float, float, float>()
                    .Member("X", &FloatRect::X)
                    .Member("Y", &FloatRect::Y)
                    .Member("Width", &FloatRect::Width)
                    .Member("Height", &FloatRect::Height));
    ns.AddClass(Class<IntRect>("IntRect")
                    .Constructor<>()
                    .Constructor<int, int, int, int>()
                    .Member("X", &IntRect::X)
                    .Member("Y", &IntRect::Y)
                    .Member("Width", &IntRect::Width)
                    .Member("Height", &IntRect::Height));
    ns.AddClass(Class<ShortRect>("ShortRect")
                    .Constructor<>()
                    .Constructor<short, short, short, short>()
                    .Member("X", &ShortRect::X)
                    .Member("Y", &ShortRect::Y)
                    .Member("Width", &ShortRect::Width)
                    .Member("Height", &ShortRect::Height));
    ns.AddClass(Class<FloatMatrix>("FloatMatrix")
                    .Constructor<>()
                    .Constructor<float, float, float, float, float, float, float, float, float>()
                    .Method("Transform", &FloatMatrix::Transform));
    ns.AddClass(Class<BoolFloatPair>("BoolFloatPair")
                    .Constructor<>()
                    .Member("first", &BoolFloatPair::first)
                    .Member("second", &BoolFloatPair::second));
    ns.AddClass(Class<Poly4>("Poly4")
                    .Constructor<>()
                    .Method("IsContains", [](const Poly4& p, const FloatVector& v) { return IsPointInPoly4(p, v); })
                    .Method("Point", [](Poly4& p, int i) -> FloatVector& { return p[std::clamp(i, 0, 3)]; })
                    .Method("Point", [](const Poly4& p, int i) -> const FloatVector& { return p[std::clamp(i, 0, 3)]; })
                    .Method("GetBoundingRect", &GetBoundingRect)
                    .Method("IsIntersects", &IsIntersects)
                    .Method("Scale", &ScalePoly));
    ns.AddClass(Class<Location>("Location")
                    .Constructor<>()
                    .Method("IsContains", [](const Location& l, const FloatVector& v) { return IsPointInPoly4(l.GetPoly(), v); })
                    .Method("Scale", [](Location& l, float k) { ScalePoly(l.Contour, k); })
                    .Method("GetPolyPos",
                            [](const Location& l, const FloatVector& v) { return Poly4ConvertToLocalPos(l.GetPoly(), v); })
                    .Method("GetAbsPos",
                            [](const Location& l, const FloatVector& v) { return Poly4ConvertToAbsPos(l.GetPoly(), v); })
                    .Method("GetPoly", &Location::GetPoly)
                    .Member("Pos", &Location::Pos)
                    .Member("Contour", &Location::Contour)
                    .Member("Angle", &Location::Angle));
    return ns;
}

mluabind::Namespace GeometryFunctions()
{
    mluabind::Namespace ns;
    ns.AddFunction(Function("Poly4ConvertToLocalPos", &Poly4ConvertToLocalPos));
    ns.AddFunction(Function("Poly4ConvertToAbsPos", [](const Poly4& p, const FloatVector& v) { return Poly4ConvertToAbsPos(p, v); }));
    ns.AddFunction(Function("CalculateFloatVectorModule", &CalculateFloatVectorModule));
    ns.AddFunction(Function("Poly4FromRect", [](const FloatRect& r) { return RectToPoly4(r); }));
    ns.AddFunction(Function("Poly4FromPoints", &Poly4FromPoints));
    ns.AddFunction(Function("MatrixIdentity", [] { return FloatMatrix::Identity(); }));
    ns.AddFunction(Function("MatrixRotation", [](float angle) { return MatrixRotation(angle); }));
    ns.AddFunction(Function("MatrixRotation",
                            [](float angle, const FloatVector& c) { return AboutPoint(MatrixRotation(angle), c); }));
    ns.AddFunction(Function("MatrixTranslation", [](float x, float y) { return MatrixTranslation(x, y); }));
    ns.AddFunction(Function("MatrixScale", [](float x, float y) { return MatrixScale(x, y); }));
    ns.AddFunction(Function("MatrixScale",
                            [](float x, float y, const FloatVector& c) { return AboutPoint(MatrixScale(x, y), c); }));
    ns.AddFunction(Function("MatrixInvert", [](const FloatMatrix& m) { return MatrixInverse(m); }));
    ns.AddFunction(Function("GetOrthogonalPos", &GetOrthogonalPos));
    ns.AddFunction(Function("GetLinesIntersect", &GetLinesIntersect));
    ns.AddFunction(Function("GetBezierPos", &GetBezierPos));
    ns.AddFunction(Function("GetAngle", &GetAngle));
    return ns;
}

// Script numbers are doubles: whole values up to 2^32 pass the bit operations unchanged.
mluabind::Namespace SystemFunctions()
{
    mluabind::Namespace ns;
    ns.AddFunction(Function("BitwiseOr", [](unsigned a, unsigned b) { return a | b; }));
    ns.AddFunction(Function("BitwiseAnd", [](unsigned a, unsigned b) { return a & b; }));
    ns.AddFunction(Function("BitwiseXor", [](unsigned a, unsigned b) { return a ^ b; }));
    ns.AddFunction(Function("StringCompare", [](const char* a, const char* b) {
        return std::strcmp(a ? a : "", b ? b : "");
    }));
    ns.AddFunction(Function("WriteWindowsClipboardAsText", &sys::SetClipboardText));
    ns.AddFunction(Function("ReadWindowsClipboardAsText", [] {
        wstring text;
        sys::GetClipboardText(text);
        return text;
    }));
    ns.AddFunction(Function("AppendPath", &sys::AppendPath));
    ns.AddFunction(Function("CheckExistPath", &sys::CheckExistPath));
    ns.AddFunction(Function("CalcFileCRC", &sys::CalcFileCRC));
    ns.AddFunction(Function("SetNamedFullAccess", &sys::SetNamedFullAccess));
    ns.AddFunction(Function("Compress", &sys::Compress));
    ns.AddFunction(Function("Uncompress", &sys::Uncompress));
    ns.AddFunction(Function("SetCurrentDirectory", &sys::SetCurrentDirectory));
    ns.AddFunction(Function("GetCurrentDirectory", &sys::GetCurrentDirectory));
    ns.AddFunction(Function("MessageBox", [](const char* caption, const char* text) {
        diag::message::Show(caption ? caption : "", text ? text : "");
    }));
    ns.AddFunction(Function("MessageBoxW", [](const wchar* caption, const wchar* text) {
        diag::message::Show(caption ? caption : u"", text ? text : u"");
    }));
    return ns;
}

template <class C, size_t N>
void AddFixedString(mluabind::Namespace& ns, const char* name)
{
    using S = String<C, N>;
    ns.AddClass(Class<S>(name)
                    .template Constructor<>()
                    .template Constructor<const C*>()
                    .Method("c_str", &S::c_str)
                    .Method("length", [](const S& s) { return static_cast<unsigned>(s.length()); })
                    .Method("empty", &S::empty));
}

const wchar* Text(const wchar* text) { return text ? text : u""; }

// The six forms of FormatString: wide texts and whole numbers behind a wide format.
mluabind::Namespace TextFunctions()
{
    using S = const wstring&;
    mluabind::Namespace ns;
    AddFixedString<char, 24>(ns, "StringA24");
    AddFixedString<char, 32>(ns, "StringA32");
    AddFixedString<char, 40>(ns, "StringA40");
    AddFixedString<char, 56>(ns, "StringA56");
    AddFixedString<char, 88>(ns, "StringA88");
    AddFixedString<char, 120>(ns, "StringA120");
    AddFixedString<wchar, 28>(ns, "StringW28");
    AddFixedString<wchar, 60>(ns, "StringW60");
    AddFixedString<wchar, 124>(ns, "StringW124");
    ns.AddFunction(Function("FormatString", [](const wchar* f, S a) { return FormatString(Text(f), a.c_str()); }));
    ns.AddFunction(Function("FormatString",
                            [](const wchar* f, S a, S b) { return FormatString(Text(f), a.c_str(), b.c_str()); }));
    ns.AddFunction(Function("FormatString", [](const wchar* f, int a) { return FormatString(Text(f), a); }));
    ns.AddFunction(Function("FormatString", [](const wchar* f, int a, int b) { return FormatString(Text(f), a, b); }));
    ns.AddFunction(Function("FormatString", [](const wchar* f, S a, int b) { return FormatString(Text(f), a.c_str(), b); }));
    ns.AddFunction(Function("FormatString", [](const wchar* f, int a, S b) { return FormatString(Text(f), a, b.c_str()); }));
    return ns;
}

CStringTable& Strings() { return CStringTable::Instance(); }

// _T runs a text through the table ("$id" references); T_ gives the text of an id.
mluabind::Namespace StringTableNames()
{
    using T = CStringTable;
    mluabind::Namespace ns;
    ns.AddClass(Class<T>("CStringTable")
                    .Method("GetString", &T::GetString)
                    .Method("FormatByStringsID", static_cast<wstring (T::*)(const wstring&) const>(&T::FormatByStringsID))
                    .Method("FormatByStringsID",
                            static_cast<wstring (T::*)(const std::string&) const>(&T::FormatByStringsID))
                    .Method("FormatByStringsID", static_cast<wstring (T::*)(const char*) const>(&T::FormatByStringsID)));
    ns.AddFunction(Function("CStringTable.Instance", &T::Instance));
    ns.AddFunction(Function("g_StringTable.Instance", &T::Instance));
    ns.AddClass(Class<CLocalString>("CLocalString")
                    .Constructor<>()
                    .Constructor<const wstring&>()
                    .Method("c_str", &CLocalString::c_str));
    ns.AddFunction(Function("_T", [](const wstring& text) { return Strings().FormatByStringsID(text); }));
    ns.AddFunction(Function("_T", [](const std::string& text) { return Strings().FormatByStringsID(text); }));
    ns.AddFunction(Function("_T", [](const char* text) { return Strings().FormatByStringsID(text); }));
    ns.AddFunction(Function("T_", [](int id) { return Strings().GetString(id); }));
    ns.AddFunction(Function("T_", [](const char* id) { return Strings().GetString(id ? std::atoi(id) : 0); }));
    return ns;
}

mluabind::Namespace XmlClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<CRefCountedObj>("CRefCountedObj"));
    ns.AddClass(Class<CXmlWriter>("CXmlWriter")
                    .BaseClass<CRefCountedObj>()
                    .Constructor<bool>()
                    .Method("SaveToFile", &CXmlWriter::SaveToFile)
                    .Method("Write", static_cast<void (CXmlWriter::*)(const char*, int)>(&CXmlWriter::Write))
                    .Method("Write", static_cast<void (CXmlWriter::*)(const wchar*)>(&CXmlWriter::Write)));
    ns.AddClass(Class<CXmlElement>("CXmlElement")
                    .Constructor<CXmlWriter&, const char*>()
                    .Constructor<CXmlElement&, const char*>()
                    .Method("Flush", &CXmlElement::Flush)
                    .Method("Attr", static_cast<void (CXmlElement::*)(const char*, const char*)>(&CXmlElement::Attr)));
    return ns;
}

} // namespace

void BindMisc(mluabind::CHost& host)
{
    mluabind::Namespace misc("misc");
    misc.Merge(GeometryClasses())
        .Merge(GeometryFunctions())
        .Merge(SystemFunctions())
        .Merge(TextFunctions())
        .Merge(StringTableNames())
        .Merge(XmlClasses());
    host.Bind(mluabind::Namespace("ox").Merge(misc));
}

} // namespace ox::misc

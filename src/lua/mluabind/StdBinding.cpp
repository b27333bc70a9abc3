// std.string and std.wstring: each native overload of the usual members is a Lua overload.
// There are no default arguments in Lua calls, so every form takes all its parameters.
#include "lua/mluabind/StdBinding.h"

#include <algorithm>

namespace mluabind {

namespace {

// Text from a script may be nil, and a count may run past its end: both are cut to what
// is there.
template <class Ch>
const Ch* Text(const Ch* text)
{
    static const Ch empty[1] = {};
    return text ? text : empty;
}

template <class Ch>
unsigned long Count(const Ch* text, unsigned long count)
{
    return std::min<unsigned long>(count, std::char_traits<Ch>::length(Text(text)));
}

template <class S>
i::CCl<S>& BasicStringClass(const char* name)
{
    using Ch = typename S::value_type;
    using CP = const Ch*;
    using N = unsigned long;
    auto& cls = Class<S>(name);
    cls.template Constructor<>()
        .template Constructor<CP>()
        .template Constructor<const S&>()
        .Constant("npos", static_cast<double>(S::npos));

    cls.Method("append", [](S& s, const S& t) -> S& { return s.append(t); })
        .Method("append", [](S& s, const S& t, N pos, N n) -> S& { return s.append(t, pos, n); })
        .Method("append", [](S& s, CP t, N n) -> S& { return s.append(Text(t), Count(t, n)); })
        .Method("append", [](S& s, CP t) -> S& { return s.append(Text(t)); })
        .Method("append", [](S& s, N n, Ch c) -> S& { return s.append(n, c); });
    cls.Method("assign", [](S& s, const S& t) -> S& { return s.assign(t); })
        .Method("assign", [](S& s, const S& t, N pos, N n) -> S& { return s.assign(t, pos, n); })
        .Method("assign", [](S& s, CP t, N n) -> S& { return s.assign(Text(t), Count(t, n)); })
        .Method("assign", [](S& s, CP t) -> S& { return s.assign(Text(t)); })
        .Method("assign", [](S& s, N n, Ch c) -> S& { return s.assign(n, c); });
    cls.Method("at", [](S& s, N pos) -> Ch& { return s.at(pos); })
        .Method("at", [](const S& s, N pos) -> const Ch& { return s.at(pos); });
    cls.Method("c_str", [](const S& s) { return s.c_str(); })
        .Method("capacity", [](const S& s) { return static_cast<N>(s.capacity()); })
        .Method("length", [](const S& s) { return static_cast<N>(s.length()); })
        .Method("max_size", [](const S& s) { return static_cast<N>(s.max_size()); });
    cls.Method("compare", [](const S& s, const S& t) { return s.compare(t); })
        .Method("compare", [](const S& s, N pos, N n, const S& t) { return s.compare(pos, n, t); })
        .Method("compare", [](const S& s, N pos, N n, const S& t, N pos2, N n2) { return s.compare(pos, n, t, pos2, n2); })
        .Method("compare", [](const S& s, CP t) { return s.compare(Text(t)); })
        .Method("compare", [](const S& s, N pos, N n, CP t) { return s.compare(pos, n, Text(t)); })
        .Method("compare", [](const S& s, N pos, N n, CP t, N n2) { return s.compare(pos, n, Text(t), Count(t, n2)); });
    cls.Method("erase", [](S& s, N pos, N n) -> S& { return s.erase(pos, n); });

#define MLUABIND_STRING_SEARCH(NAME)                                                                   \
    cls.Method(#NAME, [](const S& s, const S& t, N pos) { return static_cast<N>(s.NAME(t, pos)); })   \
        .Method(#NAME, [](const S& s, CP t, N pos, N n) { return static_cast<N>(s.NAME(Text(t), pos, Count(t, n))); }) \
        .Method(#NAME, [](const S& s, CP t, N pos) { return static_cast<N>(s.NAME(Text(t), pos)); }) \
        .Method(#NAME, [](const S& s, Ch c, N pos) { return static_cast<N>(s.NAME(c, pos)); });
    MLUABIND_STRING_SEARCH(find)
    MLUABIND_STRING_SEARCH(rfind)
    MLUABIND_STRING_SEARCH(find_first_of)
    MLUABIND_STRING_SEARCH(find_first_not_of)
    MLUABIND_STRING_SEARCH(find_last_of)
    MLUABIND_STRING_SEARCH(find_last_not_of)
#undef MLUABIND_STRING_SEARCH

    cls.Method("insert", [](S& s, N pos, const S& t) -> S& { return s.insert(pos, t); })
        .Method("insert", [](S& s, N pos, const S& t, N pos2, N n) -> S& { return s.insert(pos, t, pos2, n); })
        .Method("insert", [](S& s, N pos, CP t, N n) -> S& { return s.insert(pos, Text(t), Count(t, n)); })
        .Method("insert", [](S& s, N pos, CP t) -> S& { return s.insert(pos, Text(t)); })
        .Method("insert", [](S& s, N pos, N n, Ch c) -> S& { return s.insert(pos, n, c); });
    cls.Method("push_back", [](S& s, Ch c) { s.push_back(c); });
    cls.Method("replace", [](S& s, N pos, N n, const S& t) -> S& { return s.replace(pos, n, t); })
        .Method("replace", [](S& s, N pos, N n, const S& t, N pos2, N n2) -> S& { return s.replace(pos, n, t, pos2, n2); })
        .Method("replace", [](S& s, N pos, N n, CP t, N n2) -> S& { return s.replace(pos, n, Text(t), Count(t, n2)); })
        .Method("replace", [](S& s, N pos, N n, CP t) -> S& { return s.replace(pos, n, Text(t)); })
        .Method("replace", [](S& s, N pos, N n, N n2, Ch c) -> S& { return s.replace(pos, n, n2, c); });
    cls.Method("reserve", [](S& s, N n) { s.reserve(n); })
        .Method("resize", [](S& s, N n) { s.resize(n); })
        .Method("resize", [](S& s, N n, Ch c) { s.resize(n, c); })
        .Method("substr", [](const S& s, N pos, N n) { return s.substr(pos, n); });
    return cls;
}

} // namespace

Namespace BindStdStrings()
{
    Namespace ns("std");
    ns.AddClass(BasicStringClass<std::string>("string"));
    ns.AddClass(BasicStringClass<std::u16string>("wstring"));
    return ns;
}

} // namespace mluabind

#pragma once
// Bound forms of standard types: std.string and std.wstring, containers with their
// iterators, the engine's generic iterator, and intrusive pointer classes. Each binder
// must run in declaration mode; the results go into a namespace and through Bind.
#include "lua/mluabind/Binding.h"
#include "misc/GenericIterator.h"

#include <boost/intrusive_ptr.hpp>

#include <iterator>
#include <list>
#include <string>
#include <vector>

namespace mluabind {

// The namespace "std" with the classes string and wstring.
Namespace BindStdStrings();

// An iterator as a script holds it; `value` reads (and, where it may, writes) the element.
template <class Iterator, class Value>
struct STLIteratorHolder {
    Iterator It{};
    STLIteratorHolder() = default;
    explicit STLIteratorHolder(Iterator it) : It(it) {}
    Value& GetValue() const { return *It; }
    bool operator==(const STLIteratorHolder& other) const { return It == other.It; }
};

// A class held by boost::intrusive_ptr, as scripts see it: built empty or from an object
// (whose ownership moves from Lua to the pointer), with get, swap, and every method of
// the object.
template <class T>
i::CCl<boost::intrusive_ptr<T>>& IntrusivePtrClass(const char* name)
{
    using P = boost::intrusive_ptr<T>;
    return Class<P>(name)
        .template Constructor<>()
        .template Constructor<T*>(Adopt(1))
        .Method("get", [](const P& p) -> T* { return p.get(); })
        .Method("swap", [](P& p, P& other) { p.swap(other); })
        .template ConvertsTo<T>([](P& p) -> T* { return p.get(); });
}

// Get (const and not), Next and IsEnd of ox::misc::CGenericIterator.
template <class Container>
i::CCl<ox::misc::CGenericIterator<Container>>& GenericIteratorClass(const char* name)
{
    using I = ox::misc::CGenericIterator<Container>;
    using V = typename Container::value_type;
    return Class<I>(name)
        .Method("Get", [](I& it) -> V& { return it.Get(); })
        .Method("Get", [](const I& it) -> const V& { return it.Get(); })
        .Method("Next", &I::Next)
        .Method("IsEnd", &I::IsEnd);
}

namespace i {

template <class Iterator, class Value, bool RandomAccess, bool Mutable>
CCl<STLIteratorHolder<Iterator, Value>>& IteratorClass(const char* name)
{
    using H = STLIteratorHolder<Iterator, Value>;
    auto& cls = Class<H>(name);
    cls.template Constructor<const H&>();
    if constexpr (Mutable)
        cls.Property("value", [](const H& h) -> Value& { return h.GetValue(); },
                     [](H& h, const std::remove_const_t<Value>& value) { *h.It = value; });
    else
        cls.Property("value", [](const H& h) -> Value& { return h.GetValue(); });
    cls.Operator(OpEq, [](const H& a, const H& b) { return a == b; });
    if constexpr (RandomAccess) {
        cls.Operator(OpAdd, [](const H& h, int n) { return H(h.It + n); });
        cls.Operator(OpSub, [](const H& h, int n) { return H(h.It - n); });
        cls.Operator(OpLt, [](const H& a, const H& b) { return a.It < b.It; });
        cls.Operator(OpLe, [](const H& a, const H& b) { return a.It <= b.It; });
    }
    return cls;
}

// The members every container shares.
template <class C>
void BindContainerCommon(CCl<C>& cls)
{
    using V = typename C::value_type;
    using It = STLIteratorHolder<typename C::iterator, V>;
    using CIt = STLIteratorHolder<typename C::const_iterator, const V>;
    using RIt = STLIteratorHolder<typename C::reverse_iterator, V>;
    using CRIt = STLIteratorHolder<typename C::const_reverse_iterator, const V>;
    cls.template Constructor<>();
    cls.template Constructor<const C&>();
    cls.Method("begin", [](C& c) { return It(c.begin()); });
    cls.Method("begin", [](const C& c) { return CIt(c.begin()); });
    cls.Method("_end", [](C& c) { return It(c.end()); });
    cls.Method("_end", [](const C& c) { return CIt(c.end()); });
    cls.Method("rbegin", [](C& c) { return RIt(c.rbegin()); });
    cls.Method("rbegin", [](const C& c) { return CRIt(c.rbegin()); });
    cls.Method("rend", [](C& c) { return RIt(c.rend()); });
    cls.Method("rend", [](const C& c) { return CRIt(c.rend()); });
    cls.Method("clear", [](C& c) { c.clear(); });
    cls.Method("empty", [](const C& c) { return c.empty(); });
    cls.Method("erase", [](C& c, const It& at) { return It(c.erase(at.It)); });
    cls.Method("erase", [](C& c, const It& first, const It& last) { return It(c.erase(first.It, last.It)); });
    cls.Method("insert", [](C& c, const It& at, const V& value) { return It(c.insert(at.It, value)); });
    cls.Method("insert", [](C& c, const It& at, unsigned long count, const V& value) { return It(c.insert(at.It, count, value)); });
    cls.Method("insert", [](C& c, const It& at, const It& first, const It& last) { return It(c.insert(at.It, first.It, last.It)); });
    cls.Method("insert", [](C& c, const It& at, const CIt& first, const CIt& last) { return It(c.insert(at.It, first.It, last.It)); });
    cls.Method("insert", [](C& c, const It& at, const RIt& first, const RIt& last) { return It(c.insert(at.It, first.It, last.It)); });
    cls.Method("insert", [](C& c, const It& at, const CRIt& first, const CRIt& last) { return It(c.insert(at.It, first.It, last.It)); });
    cls.Method("size", [](const C& c) { return static_cast<unsigned long>(c.size()); });
    cls.Method("swap", [](C& c, C& other) { c.swap(other); });
    cls.Method("max_size", [](const C& c) { return static_cast<unsigned long>(c.max_size()); });
    cls.Method("assign", [](C& c, unsigned long count, const V& value) { c.assign(count, value); });
    cls.Method("assign", [](C& c, const It& first, const It& last) { c.assign(first.It, last.It); });
    cls.Method("assign", [](C& c, const CIt& first, const CIt& last) { c.assign(first.It, last.It); });
    cls.Method("assign", [](C& c, const RIt& first, const RIt& last) { c.assign(first.It, last.It); });
    cls.Method("assign", [](C& c, const CRIt& first, const CRIt& last) { c.assign(first.It, last.It); });
    cls.Method("back", [](C& c) -> V& { return c.back(); });
    cls.Method("back", [](const C& c) -> const V& { return c.back(); });
    cls.Method("front", [](C& c) -> V& { return c.front(); });
    cls.Method("front", [](const C& c) -> const V& { return c.front(); });
    cls.Method("pop_back", [](C& c) { c.pop_back(); });
    cls.Method("push_back", [](C& c, const V& value) { c.push_back(value); });
}

template <class C, bool RandomAccess>
Namespace ContainerNamespace(const char* name, CCl<C>& cls)
{
    using V = typename C::value_type;
    std::string prefix = std::string(name) + ".";
    Namespace ns;
    ns.AddClass(cls);
    ns.AddClass(IteratorClass<typename C::iterator, V, RandomAccess, true>((prefix + "iterator").c_str()));
    ns.AddClass(IteratorClass<typename C::const_iterator, const V, RandomAccess, false>((prefix + "const_iterator").c_str()));
    ns.AddClass(IteratorClass<typename C::reverse_iterator, V, RandomAccess, true>((prefix + "reverse_iterator").c_str()));
    ns.AddClass(IteratorClass<typename C::const_reverse_iterator, const V, RandomAccess, false>(
        (prefix + "const_reverse_iterator").c_str()));
    return ns;
}

} // namespace i

// std::vector<V> as the class `name`, with its four iterator classes inside its table
// (name.iterator, name.const_iterator, ...). Merge the result into the namespace.
template <class V>
Namespace VectorClass(const char* name)
{
    using C = std::vector<V>;
    auto& cls = Class<C>(name);
    i::BindContainerCommon(cls);
    cls.Method("at", [](C& c, unsigned long index) -> V& { return c.at(index); });
    cls.Method("at", [](const C& c, unsigned long index) -> const V& { return c.at(index); });
    cls.Method("capacity", [](const C& c) { return static_cast<unsigned long>(c.capacity()); });
    cls.Method("reserve", [](C& c, unsigned long count) { c.reserve(count); });
    cls.Method("resize", [](C& c, unsigned long count) { c.resize(count); });
    return i::ContainerNamespace<C, true>(name, cls);
}

template <class V>
Namespace ListClass(const char* name)
{
    using C = std::list<V>;
    auto& cls = Class<C>(name);
    i::BindContainerCommon(cls);
    cls.Method("merge", [](C& c, C& other) { c.merge(other); });
    cls.Method("pop_front", [](C& c) { c.pop_front(); });
    cls.Method("push_front", [](C& c, const V& value) { c.push_front(value); });
    cls.Method("remove", [](C& c, const V& value) { c.remove(value); });
    cls.Method("reverse", [](C& c) { c.reverse(); });
    cls.Method("resize", [](C& c, unsigned long count) { c.resize(count); });
    cls.Method("resize", [](C& c, unsigned long count, const V& value) { c.resize(count, value); });
    return i::ContainerNamespace<C, false>(name, cls);
}

} // namespace mluabind

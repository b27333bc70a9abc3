// Class registry algorithms: method tables, up-cast paths, casts, implicit construction,
// conversion adapters and call policies.
#include "lua/mluabind/impl/Declarations.h"

#include "lua/mluabind/impl/Params.h"

#include <algorithm>

namespace mluabind::i {

namespace {
constexpr size_t NoPath = 10000;
constexpr int MaxCastDepth = 32;
} // namespace

void GenericClass::AddMethod(GenericMethod* method)
{
    // After the overloads of the same name already there: lists follow declaration order.
    auto at = std::upper_bound(m_Methods.begin(), m_Methods.end(), method->Name.c_str(), NameLess());
    m_Methods.insert(at, MethodEntry(method->Name.c_str(), method));
}

void GenericClass::AddOperator(int index, GenericMethod* method)
{
    auto at = std::upper_bound(m_Operators.begin(), m_Operators.end(), index,
                               [](int value, const std::pair<int, GenericMethod*>& entry) { return value < entry.first; });
    m_Operators.insert(at, std::make_pair(index, method));
}

std::pair<const GenericClass::MethodEntry*, const GenericClass::MethodEntry*> GenericClass::FindMethodRun(const char* name) const
{
    auto [begin, end] = std::equal_range(m_Methods.begin(), m_Methods.end(), name, NameLess());
    if (begin == end)
        return {nullptr, nullptr};
    return {&*begin, &*begin + (end - begin)};
}

std::pair<const std::pair<int, GenericMethod*>*, const std::pair<int, GenericMethod*>*> GenericClass::FindOperatorRun(int index) const
{
    auto begin = std::lower_bound(m_Operators.begin(), m_Operators.end(), index,
                                  [](const std::pair<int, GenericMethod*>& entry, int value) { return entry.first < value; });
    auto end = begin;
    while (end != m_Operators.end() && end->first == index)
        ++end;
    if (begin == end)
        return {nullptr, nullptr};
    return {&*begin, &*begin + (end - begin)};
}

const MethodRun* GenericClass::FindRun(const char* name)
{
    if (m_RunsBuiltFor != m_Methods.size()) {
        // Existing runs are updated in place: closures may hold them.
        for (auto& [run_name, run] : m_Runs)
            run.Count = 0;
        for (size_t k = 0; k < m_Methods.size();) {
            size_t end = k + 1;
            while (end < m_Methods.size() && std::strcmp(m_Methods[end].first, m_Methods[k].first) == 0)
                ++end;
            MethodRun& run = m_Runs[m_Methods[k].first];
            run.Owner = this;
            run.Begin = &m_Methods[k];
            run.Count = end - k;
            run.Typed = std::all_of(run.Begin, run.Begin + run.Count,
                                    [](const MethodEntry& entry) { return entry.second->Typed && !entry.second->SelfFirst; });
            run.ChosenFor = 0;
            k = end;
        }
        m_RunsBuiltFor = m_Methods.size();
    }
    auto it = m_Runs.find(name);
    return it == m_Runs.end() || it->second.Count == 0 ? nullptr : &it->second;
}

namespace {

constexpr int MaxSearchDepth = 32;

// The overloads of `name` in the class itself, else the first found through its adapters
// in map order; the path of `found` gets the adapters on the way.
bool FindMethodPath(CHost& host, GenericClass* cls, const char* name, int depth, Resolution& found)
{
    if (const MethodRun* run = cls->FindRun(name)) {
        found.What = Resolution::Method;
        found.Owner = cls;
        found.Run = run;
        return true;
    }
    if (depth >= MaxSearchDepth)
        return false;
    for (auto& [type, adapter] : cls->m_Adapters) {
        GenericClass* target = adapter->GetTargetGenericClass(host);
        if (!target)
            continue;
        found.Path.push_back(adapter);
        if (FindMethodPath(host, target, name, depth + 1, found))
            return true;
        found.Path.pop_back();
    }
    return false;
}

// A member, then a constant, of the class, then the same through its adapters.
bool FindMemberPath(CHost& host, GenericClass* cls, const char* name, int depth, Resolution& found)
{
    found.FoundMember = cls->FindOwnMember(name);
    found.FoundConstant = found.FoundMember ? nullptr : cls->FindOwnConstant(name);
    if (found.FoundMember || found.FoundConstant) {
        found.What = found.FoundMember ? Resolution::Member : Resolution::Constant;
        found.Owner = cls;
        return true;
    }
    if (depth >= MaxSearchDepth)
        return false;
    for (auto& [type, adapter] : cls->m_Adapters) {
        GenericClass* target = adapter->GetTargetGenericClass(host);
        if (!target)
            continue;
        found.Path.push_back(adapter);
        if (FindMemberPath(host, target, name, depth + 1, found))
            return true;
        found.Path.pop_back();
    }
    return false;
}

} // namespace

Resolution* GenericClass::Resolve(CHost& host, const char* name)
{
    auto it = m_Resolutions.find(name);
    if (it != m_Resolutions.end()) {
        if (it->second.Stamp != host.GetStamp())
            Refresh(host, it->second);
        return &it->second;
    }
    Resolution resolution;
    resolution.Class = this;
    resolution.Name = name;
    Refresh(host, resolution);
    if (resolution.What == Resolution::Nothing)
        return nullptr; // unknown names leave nothing behind
    return &m_Resolutions.emplace(name, std::move(resolution)).first->second;
}

void GenericClass::Refresh(CHost& host, Resolution& resolution)
{
    const char* name = resolution.Name.c_str();
    resolution.Stamp = host.GetStamp();
    resolution.What = Resolution::Nothing;
    resolution.Owner = nullptr;
    resolution.Run = nullptr;
    resolution.FoundMember = nullptr;
    resolution.FoundConstant = nullptr;
    resolution.Path.clear();
    // Every method of every base comes before any member. A failed search leaves the
    // path empty.
    if (!FindMethodPath(host, this, name, 0, resolution))
        FindMemberPath(host, this, name, 0, resolution);
}

GenericMember* GenericClass::FindOwnMember(const char* name) const
{
    for (auto& [member_name, member] : m_Members)
        if (std::strcmp(member_name, name) == 0)
            return member;
    return nullptr;
}

GenericConstant* GenericClass::FindOwnConstant(const char* name) const
{
    for (auto& [constant_name, constant] : m_Constants)
        if (std::strcmp(constant_name, name) == 0)
            return constant;
    return nullptr;
}

bool GenericClass::CanUpcast(const std::type_info& type) const
{
    return IsType(type) || m_UpcastPaths.count(std::type_index(type)) != 0;
}

void* GenericClass::Upcast(CHost& host, const std::type_info& type, void* object)
{
    GenericClass* cls = this;
    for (int depth = 0; depth < MaxCastDepth && object; ++depth) {
        if (cls->IsType(type))
            return object;
        auto path = cls->m_UpcastPaths.find(std::type_index(type));
        if (path == cls->m_UpcastPaths.end() || path->second.empty())
            return nullptr;
        if (path->second.size() == 1)
            return cls->m_Adapters.at(std::type_index(type))->Upcast(object);
        // The next class on the way is the last-but-one entry of the path.
        GenericClass* next = path->second[path->second.size() - 2];
        auto adapter = cls->m_Adapters.find(std::type_index(*next->m_Type));
        if (adapter == cls->m_Adapters.end())
            return nullptr;
        object = adapter->second->Upcast(object);
        cls = next;
    }
    (void)host;
    return nullptr;
}

void GenericClass::ComputeUpcastPaths(CHost& host)
{
    m_UpcastPaths.clear();
    for (auto& [type, adapter] : m_Adapters)
        m_UpcastPaths[type] = {this};
    for (auto& [type, adapter] : m_Adapters) {
        GenericClass* target = adapter->GetTargetGenericClass(host);
        if (!target || target == this)
            continue;
        for (auto& [reachable, path] : target->m_UpcastPaths) {
            auto present = m_UpcastPaths.find(reachable);
            size_t length = present == m_UpcastPaths.end() ? NoPath : present->second.size();
            if (path.size() + 1 < length) {
                std::vector<GenericClass*> longer = path;
                longer.push_back(this);
                m_UpcastPaths[reachable] = std::move(longer);
            }
        }
    }
}

namespace {

void* CastToDepth(GenericClass* cls, CHost& host, const std::type_info& type, void* object, int depth)
{
    if (cls->IsType(type))
        return object;
    if (cls->CanUpcast(type))
        return cls->Upcast(host, type, object);
    if (depth >= MaxCastDepth)
        return nullptr;
    // Down: along the target's path to this class, starting on this class's side.
    GenericClass* target = host.FindClass(type);
    if (target && target->CanUpcast(*cls->m_Type)) {
        const std::vector<GenericClass*>& path = target->m_UpcastPaths.at(std::type_index(*cls->m_Type));
        GenericClass* at = cls;
        void* current = object;
        bool usable = true;
        for (GenericClass* step : path) {
            auto adapter = step->m_Adapters.find(std::type_index(*at->m_Type));
            if (adapter == step->m_Adapters.end() || !adapter->second->CanDowncast()) {
                usable = false;
                break;
            }
            current = adapter->second->Downcast(current);
            if (!current)
                break;
            at = step;
        }
        if (usable && current)
            return current;
    }
    // Sideways: up through each adapter, then let that class try.
    for (auto& [adapter_type, adapter] : cls->m_Adapters) {
        GenericClass* next = adapter->GetTargetGenericClass(host);
        if (!next)
            continue;
        if (void* result = CastToDepth(next, host, type, adapter->Upcast(object), depth + 1))
            return result;
    }
    return nullptr;
}

} // namespace

void* GenericClass::CastTo(CHost& host, const std::type_info& type, void* object)
{
    return CastToDepth(this, host, type, object, 0);
}

ConstructorDescription* GenericClass::FindImplicitConstructor(CHost& host, lua_State* L, int index) const
{
    for (ConstructorDescription* constructor : m_Constructors) {
        if (constructor->ParameterCount == 1 && !constructor->Policy && !constructor->IsExplicit &&
            constructor->MatchFunction(host, L, index, 1, false) < NoMatch)
            return constructor;
    }
    return nullptr;
}

void* GenericClass::ConstructObjectFrom(CHost& host, lua_State* L, int index)
{
    ConstructorDescription* constructor = FindImplicitConstructor(host, L, index);
    if (!constructor || !m_Destroy) {
        host.Report("GenericClass::ConstructObjectFrom: panic - can't find constructor to impicity create object '%s'",
                    FullName.c_str());
        return nullptr;
    }
    void* object = constructor->CreateFunction(host, L, index);
    if (object)
        host.AddTemporary(object, m_Destroy);
    return object;
}

GenericClass* ClassUpCastConvertAdapter::GetTargetGenericClass(CHost& host)
{
    if (m_TargetStamp != host.GetStamp()) {
        m_TargetClass = host.FindClass(*m_Target);
        m_TargetStamp = host.GetStamp();
        if (!m_TargetClass)
            host.Report("ClassUpCastConvertAdapter::GetTargetGenericClass: panic - can't find generic class for %s!\n",
                        TypeName(*m_Target).c_str());
    }
    return m_TargetClass;
}

int GenericMethod::TryCall(CHost&, lua_State*, LuaCustomVariable&) { return NotTaken; }

int GenericFunction::TryCall(CHost&, lua_State*) { return NotTaken; }

void GenericMethodPolicy::BeforeCall(CHost&, lua_State*, LuaCustomVariable*) {}

int GenericMethodPolicy::AfterCall(CHost&, lua_State*, LuaCustomVariable*, int result_count) { return result_count; }

void GenericMethodPolicy::RunBefore(CHost& host, lua_State* L, LuaCustomVariable* self)
{
    BeforeCall(host, L, self);
    for (GenericMethodPolicy* policy : m_Further)
        policy->RunBefore(host, L, self);
}

int GenericMethodPolicy::RunAfter(CHost& host, lua_State* L, LuaCustomVariable* self, int result_count)
{
    result_count = AfterCall(host, L, self, result_count);
    for (GenericMethodPolicy* policy : m_Further)
        result_count = policy->RunAfter(host, L, self, result_count);
    return result_count;
}

void AdoptPolicy::BeforeCall(CHost&, lua_State* L, LuaCustomVariable* self)
{
    if (m_Index == 0) {
        if (self)
            self->IsOwned = 0;
    } else if (m_Index > 0 && lua_gettop(L) >= m_Index) {
        if (LuaCustomVariable* argument = ToVariable(L, m_Index))
            argument->IsOwned = 0;
    }
}

int AdoptPolicy::AfterCall(CHost&, lua_State* L, LuaCustomVariable*, int result_count)
{
    if (m_Index == -1 && result_count == 1) {
        if (LuaCustomVariable* result = ToVariable(L, -1))
            result->IsOwned = 1;
    }
    return result_count;
}

} // namespace mluabind::i

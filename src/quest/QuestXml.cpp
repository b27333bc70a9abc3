// The XML forms of the quest tree: the editor's full form and the brief form of a level's
// state inside a save. Attributes are written in the order of the kinds, base first.
#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "quest/Area.h"
#include "quest/ClipObject.h"
#include "quest/ImageObject.h"
#include "quest/Quest.h"
#include "quest/SceneGroup.h"

#include <exception>

namespace qe {

using ox::core::CSettingsGroup;
using ox::misc::CXmlElement;
using ox::misc::ToXmlValue;

namespace {

constexpr const char* kScriptNames[CBaseSceneObject::ScriptCount] = {"s1", "s2", "s3", "s4"};

void Text(CXmlElement& element, const char* name, const std::string& value)
{
    element.Attr(name, ox::misc::EscapeXml(value).c_str());
}

void ReadText(const CSettingsGroup& element, const char* name, std::string& value)
{
    if (element.IsValue(name))
        value = element.GetValue(name);
}

bool Named(const CSettingsGroup& element, const char* name) { return element.GetId().view() == name; }

} // namespace

// A new object from an element of a scene's `objects` (an image, a clip or a group), loaded;
// null for any other element. A value that does not read is logged naming the object.
CBaseSceneObject* LoadSceneChild_(const CSettingsGroup* element, bool brief)
{
    if (!element)
        return nullptr;
    BaseSceneObjectPtrT object;
    if (Named(*element, "group")) {
        object.reset(new CSceneGroup());
    } else if (Named(*element, "object")) {
        const std::string& type = element->GetValue("type");
        if (type == "image")
            object.reset(new CImageObject());
        else if (type == "clip")
            object.reset(new CClipObject());
    }
    if (!object)
        return nullptr;
    try {
        object->Load(*element, brief);
    } catch (const std::exception& e) {
        OX_LOG("quest", ox::diag::LogError, "Object '%s': a value does not read (%s); left out",
               element->GetValue("id").c_str(), e.what());
        return nullptr;
    }
    return object.detach();
}

// --- objects --------------------------------------------------------------------------------

void CBaseSceneObject::Save(CXmlElement& parent, bool brief) const
{
    CXmlElement element(parent, XmlName());
    SaveAttributes(element, brief);
    SaveChildren(element, brief);
}

void CBaseSceneObject::SaveAttributes(CXmlElement& element, bool brief) const
{
    element.Attr("object_flags", ToXmlValue(m_ObjectFlags));
    Text(element, "id", m_Id);
    Text(element, "hint", m_Hint);
    if (brief)
        return;
    element.Attr("editor_flags", ToXmlValue(m_Flags & ~uint32_t(FlagSelected)));
    for (int kind = 0; kind < ScriptCount; ++kind)
        Text(element, kScriptNames[kind], m_Scripts[kind]);
}

void CBaseSceneObject::Load(const CSettingsGroup& element, bool brief)
{
    int flags = static_cast<int>(m_ObjectFlags);
    ox::core::ReadInt(element, "object_flags", flags);
    m_ObjectFlags = static_cast<uint32_t>(flags);
    ReadText(element, "id", m_Id);
    ReadText(element, "hint", m_Hint);
    if (brief)
        return;
    flags = static_cast<int>(m_Flags);
    ox::core::ReadInt(element, "editor_flags", flags);
    m_Flags = static_cast<uint32_t>(flags) & ~uint32_t(FlagSelected);
    for (int kind = 0; kind < ScriptCount; ++kind)
        ReadText(element, kScriptNames[kind], m_Scripts[kind]);
}

void CSceneObject::SaveAttributes(CXmlElement& element, bool brief) const
{
    CBaseSceneObject::SaveAttributes(element, brief);
    if (!brief)
        Text(element, "sound", m_Sound);
}

void CSceneObject::Load(const CSettingsGroup& element, bool brief)
{
    CBaseSceneObject::Load(element, brief);
    if (!brief)
        ReadText(element, "sound", m_Sound);
}

void CObject::SaveAttributes(CXmlElement& element, bool brief) const
{
    CSceneObject::SaveAttributes(element, brief);
    if (brief)
        return;
    element.Attr("offset", ToXmlValue(m_Pos));
    element.Attr("angle", ToXmlValue(m_Angle));
    element.Attr("size", ToXmlValue(m_Size));
}

void CObject::Load(const CSettingsGroup& element, bool brief)
{
    CSceneObject::Load(element, brief);
    if (brief)
        return;
    ox::core::ReadVector(element, "offset", m_Pos);
    ox::core::ReadFloat(element, "angle", m_Angle);
    ox::core::ReadVector(element, "size", m_Size);
}

void CObject::SaveColor(CXmlElement& element, bool brief) const
{
    if (!brief || m_Color.GetARGB() != 0xFFFFFFFFu)
        element.Attr("color", ToXmlValue(m_Color));
}

void CObject::LoadColor(const CSettingsGroup& element)
{
    m_Color = Color();
    ox::core::ReadColor(element, "color", m_Color);
}

void CImageObject::SaveAttributes(CXmlElement& element, bool brief) const
{
    CObject::SaveAttributes(element, brief);
    element.Attr("type", "image");
    SaveColor(element, brief);
    if (!brief)
        Text(element, "image_id", m_TextureId);
}

void CImageObject::Load(const CSettingsGroup& element, bool brief)
{
    CObject::Load(element, brief);
    LoadColor(element);
    if (!brief)
        SetTextureId(element.GetValue("image_id"));
}

void CClipObject::SaveAttributes(CXmlElement& element, bool brief) const
{
    CObject::SaveAttributes(element, brief);
    element.Attr("type", "clip");
    SaveColor(element, brief);
    if (brief)
        return;
    Text(element, "clip_id", m_ClipId);
    element.Attr("use_alpha", ToXmlValue(m_UseAlpha));
}

void CClipObject::Load(const CSettingsGroup& element, bool brief)
{
    CObject::Load(element, brief);
    LoadColor(element);
    if (brief)
        return;
    SetClipId(element.GetValue("clip_id"));
    ox::core::ReadBool(element, "use_alpha", m_UseAlpha);
}

void CSceneGroup::SaveChildren(CXmlElement& element, bool brief) const
{
    for (const BaseSceneObjectPtrT& state : m_Childs)
        state->Save(element, brief);
}

void CSceneGroup::Load(const CSettingsGroup& element, bool brief)
{
    CBaseSceneObject::Load(element, brief);
    const CBaseSceneObject* last = m_Childs.empty() ? nullptr : m_Childs.back().get();
    for (const auto& child : element.GetChildren()) {
        BaseSceneObjectPtrT state(LoadSceneChild_(child.get(), brief), false);
        if (!state)
            continue;
        InsertChild(state, last);
        last = state.get();
    }
}

void CArea::SaveChildren(CXmlElement& element, bool brief) const
{
    if (brief)
        return;
    for (const AreaPointPtrT& point : m_Points) {
        CXmlElement child(element, "point");
        child.Attr("offset", ToXmlValue(point->GetPos()));
    }
}

void CArea::Load(const CSettingsGroup& element, bool brief)
{
    CSceneObject::Load(element, brief);
    if (brief)
        return;
    m_Points.clear();
    m_Reported = false;
    for (const auto& child : element.GetChildren()) {
        if (!Named(*child, "point"))
            continue;
        FloatVector pos;
        ox::core::ReadVector(*child, "offset", pos);
        m_Points.push_back(AreaPointPtrT(new CAreaPoint(pos)));
    }
}

// --- scenes, levels, the quest ----------------------------------------------------------------

void CScene::Save(CXmlElement& parent, bool brief) const
{
    CXmlElement element(parent, "scene");
    Text(element, "id", m_Id);
    element.Attr("size", ToXmlValue(m_Size));
    element.Attr("offset", ToXmlValue(m_Offset));
    element.Attr("flags", ToXmlValue(m_Flags));
    Text(element, "script", m_Script);
    {
        CXmlElement objects(element, "objects");
        for (const BaseSceneObjectPtrT& object : m_Objects)
            object->Save(objects, brief);
    }
    CXmlElement areas(element, "areas");
    for (const BaseSceneObjectPtrT& area : m_Areas)
        area->Save(areas, brief);
}

void CScene::Load(const CSettingsGroup& element, bool brief)
{
    ReadText(element, "id", m_Id);
    try {
        int flags = static_cast<int>(m_Flags);
        ox::core::ReadInt(element, "flags", flags);
        m_Flags = static_cast<uint32_t>(flags);
        if (!brief) {
            ReadText(element, "script", m_Script);
            ox::core::ReadVector(element, "size", m_Size);
            ox::core::ReadVector(element, "offset", m_Offset);
        }
    } catch (const std::exception& e) {
        OX_LOG("quest", ox::diag::LogError, "Scene '%s': a value does not read (%s)", m_Id.c_str(), e.what());
    }
    const CBaseSceneObject* last = nullptr;
    if (const CSettingsGroup* objects = element.GetChildRef("objects"))
        for (const auto& child : objects->GetChildren()) {
            BaseSceneObjectPtrT object(LoadSceneChild_(child.get(), brief), false);
            if (!object)
                continue;
            InsertObject(object, last);
            last = object.get();
        }
    last = nullptr;
    if (const CSettingsGroup* areas = element.GetChildRef("areas"))
        for (const auto& child : areas->GetChildren()) {
            if (!Named(*child, "area"))
                continue;
            BaseSceneObjectPtrT area(new CArea());
            try {
                area->Load(*child, brief);
            } catch (const std::exception& e) {
                OX_LOG("quest", ox::diag::LogError, "Scene '%s', area '%s': a value does not read (%s); left out",
                       m_Id.c_str(), child->GetValue("id").c_str(), e.what());
                continue;
            }
            InsertArea(area, last);
            last = area.get();
        }
    if (!brief)
        UpdateTotalChildList();
}

void CLevel::Save(CXmlElement& parent, bool brief) const
{
    CXmlElement element(parent, "level");
    Text(element, "id", m_Id);
    if (!brief) {
        Text(element, "s1", m_Scripts[ScriptLevel]);
        Text(element, "s2", m_Scripts[ScriptStart]);
        Text(element, "sound1", m_Sounds[SoundMovingToABox]);
        Text(element, "sound2", m_Sounds[SoundOpenScene]);
    }
    for (const ScenePtrT& scene : m_Scenes)
        scene->Save(element, brief);
}

void CLevel::Load(const CSettingsGroup& element, bool brief)
{
    ReadText(element, "id", m_Id);
    if (!brief) {
        ReadText(element, "s1", m_Scripts[ScriptLevel]);
        ReadText(element, "s2", m_Scripts[ScriptStart]);
        ReadText(element, "sound1", m_Sounds[SoundMovingToABox]);
        ReadText(element, "sound2", m_Sounds[SoundOpenScene]);
    }
    const CScene* last = m_Scenes.empty() ? nullptr : m_Scenes.back().get();
    for (const auto& child : element.GetChildren()) {
        if (!Named(*child, "scene"))
            continue;
        ScenePtrT scene(new CScene());
        scene->Load(*child, brief);
        InsertScene(scene, last);
        last = scene.get();
    }
}

bool CQuest::Load(const std::string& path)
{
    ox::core::CSettings settings;
    if (!settings.LoadXmlDirect(ox::misc::ConvertToWide(path)))
        return false;
    const CLevel* last = m_Levels.empty() ? nullptr : m_Levels.back().get();
    for (const auto& child : settings.GetChild("Quest").GetChildren()) {
        if (!Named(*child, "level"))
            continue;
        LevelPtrT level(new CLevel());
        level->Load(*child, false);
        InsertLevel(level, last);
        last = level.get();
    }
    return true;
}

void CQuest::Save(const std::string& path) const
{
    boost::intrusive_ptr<ox::misc::CXmlWriter> writer(new ox::misc::CXmlWriter(true));
    {
        CXmlElement root(*writer, "Quest");
        for (const LevelPtrT& level : m_Levels)
            level->Save(root, false);
    }
    writer->SaveToFile(ox::misc::ConvertToWide(path));
}

} // namespace qe

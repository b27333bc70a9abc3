#pragma once
// The base of every node of the quest tree (quest, level, scene, scene object). Nodes are
// shared through intrusive pointers: lists own their elements, links upward are plain
// pointers. The selection pair lets an editor's tree mirror a selection on any node.
#include "misc/ptr.h"

namespace qe {

class CTreeNode : public ox::misc::CRefCountedObj {
public:
    virtual bool IsSelected() const { return false; }
    virtual void SetSelected(bool) {}
};

} // namespace qe

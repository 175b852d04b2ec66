#include "orvo/ogl/Object.h"

#include "orvo/ogl/internal/ShareGroup.h"

namespace ORVO::OGL {

Object::Object(unsigned nTarget) noexcept : nTarget_(nTarget) {}
Object::~Object() = default;

void Object::joinShareGroup() { spGroup_ = Internal::ShareGroup::current(); }

bool Object::isShareGroupCurrent() const noexcept { return spGroup_ != nullptr && spGroup_->isCurrent(); }

unsigned Object::objectID() const { return nName_; }

bool Object::isBound() const {
    unsigned const nName = objectID();
    return nName != 0 && getBoundID() == nName;
}

} // namespace ORVO::OGL

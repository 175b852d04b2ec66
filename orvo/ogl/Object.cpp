#include "orvo/ogl/Object.h"

namespace ORVO::OGL {

Object::Object(unsigned nTarget) noexcept : nTarget_(nTarget) {}
Object::~Object() = default;

unsigned Object::objectID() const { return nName_; }

bool Object::isBound() const {
    unsigned const nName = objectID();
    return nName != 0 && getBoundID() == nName;
}

} // namespace ORVO::OGL

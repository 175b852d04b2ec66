#include "orvo/image_flow/filters/ImageQuad.h"

#include "orvo/core/Check.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/FunctionTable.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

#include <array>

namespace ORVO {

ImageQuad::ImageQuad(PositionInWorldSpace const& rPosition, ExtentInWorldSpace const& rSize) : vVertices_(4) {
    set(rPosition, rSize);
}

ImageQuad::~ImageQuad() = default;

void ImageQuad::set(PositionInWorldSpace const& rPosition, ExtentInWorldSpace const& rSize) {
    ORVO_CHECK(0.f <= rSize.width() && 0.f <= rSize.height());
    vVertices_[0] = rPosition;
    vVertices_[1] = rPosition + ExtentInWorldSpace(rSize.width(), 0.0f);
    vVertices_[2] = rPosition + rSize;
    vVertices_[3] = rPosition + ExtentInWorldSpace(0.0f, rSize.height());
}

void ImageQuad::render() const {
    ORVO_OGL_REQUIRE_CONTEXT();
    static constexpr std::array<float2, 4> aZero{};
    float2 const* pCoordinate = hasTextureCoordinates() ? pTextureCoordinates_->data() : aZero.data();
    OGL::FunctionTable const& table = *OGL::ExtensionManager::Instance()->table();
    glBegin(GL_QUADS);
    for (PositionInWorldSpace const& vertex : vVertices_) {
        table.glMultiTexCoord2fv(GL_TEXTURE0, (pCoordinate++)->begin());
        glVertex2fv(vertex.positionAsFloat2().begin());
    }
    glEnd();
}

ExtentInWorldSpace ImageQuad::size() const noexcept { return vVertices_[2] - vVertices_[0]; }

void ImageQuad::createTextureCoordinates() {
    ORVO_CHECK(!hasTextureCoordinates());
    pTextureCoordinates_ = std::make_unique<std::vector<float2>>(vVertices_.size());
}

ImageQuad::const_coordinate_iterator ImageQuad::textureCoordinatesBegin() const {
    ORVO_ENFORCE(pTextureCoordinates_);
    return pTextureCoordinates_->begin();
}

ImageQuad::const_coordinate_iterator ImageQuad::textureCoordinatesEnd() const {
    ORVO_ENFORCE(pTextureCoordinates_);
    return pTextureCoordinates_->end();
}

ImageQuad::coordinate_iterator ImageQuad::textureCoordinatesBegin() {
    ORVO_ENFORCE(pTextureCoordinates_);
    return pTextureCoordinates_->begin();
}

ImageQuad::coordinate_iterator ImageQuad::textureCoordinatesEnd() {
    ORVO_ENFORCE(pTextureCoordinates_);
    return pTextureCoordinates_->end();
}

} // namespace ORVO

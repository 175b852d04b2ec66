#include "orvo/image_flow/filters/ImageQuad.h"

#include "tests/image_flow/support/ShaderRoad.h"

#include <iterator>
#include <limits>
#include <type_traits>
#include <vector>

#include "orvo/ogl/Framebuffer.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

static_assert(std::has_virtual_destructor_v<ImageQuad>);

constexpr char const* pNegative = "0.f <= rSize.width() && 0.f <= rSize.height()";

std::vector<float2> verticesOf(ImageQuad const& quad) {
    std::vector<float2> aVertices;
    for (auto i = quad.verticesBegin(); i != quad.verticesEnd(); ++i)
        aVertices.push_back(i->positionAsFloat2());
    return aVertices;
}

TEST(ImageQuadTest, HasFourVerticesAroundTheRectangle) {
    ImageQuad quad(PositionInWorldSpace(-1.0f, 2.0f), ExtentInWorldSpace(3.0f, 5.0f));
    EXPECT_EQ(4U, quad.numberOfVertices());
    EXPECT_EQ((std::vector<float2>{{-1.0f, 2.0f}, {2.0f, 2.0f}, {2.0f, 7.0f}, {-1.0f, 7.0f}}),
              verticesOf(quad));
    EXPECT_EQ(PositionInWorldSpace(-1.0f, 2.0f), quad.lowerLeft());
    EXPECT_EQ(ExtentInWorldSpace(3.0f, 5.0f), quad.size());
    quad.set(PositionInWorldSpace(10.0f, 20.0f), ExtentInWorldSpace(0.0f, 0.0f));
    EXPECT_EQ(std::vector<float2>(4, float2(10.0f, 20.0f)), verticesOf(quad));
    *quad.verticesBegin() = PositionInWorldSpace(9.0f, 9.0f);
    EXPECT_EQ(PositionInWorldSpace(9.0f, 9.0f), quad.lowerLeft());
    EXPECT_EQ(4, std::distance(quad.verticesBegin(), quad.verticesEnd()));
}

TEST(ImageQuadTest, RefusesANegativeSizeAndStaysAsItWas) {
    ImageQuad quad(PositionInWorldSpace(1.0f, 1.0f), ExtentInWorldSpace(2.0f, 2.0f));
    std::vector<float2> const aBefore = verticesOf(quad);
    float const nan = std::numeric_limits<float>::quiet_NaN();
    for (auto const& size : {ExtentInWorldSpace(-1.0f, 2.0f), ExtentInWorldSpace(2.0f, -0.5f),
                             ExtentInWorldSpace(nan, 1.0f), ExtentInWorldSpace(1.0f, nan)})
        ORVO_EXPECT_INTERNAL(quad.set(PositionInWorldSpace(5.0f, 5.0f), size), pNegative);
    EXPECT_EQ(aBefore, verticesOf(quad));
    ORVO_EXPECT_INTERNAL(ImageQuad(PositionInWorldSpace(), ExtentInWorldSpace(-1.0f, 0.0f)), pNegative);
}

TEST(ImageQuadTest, HasTextureCoordinatesOnceTheyAreCreated) {
    ImageQuad quad(PositionInWorldSpace(), ExtentInWorldSpace(1.0f, 1.0f));
    ImageQuad const& constQuad = quad;
    EXPECT_FALSE(quad.hasTextureCoordinates());
    ORVO_EXPECT_INTERNAL(quad.textureCoordinatesBegin(), "Enforce pTextureCoordinates_ != NULL");
    ORVO_EXPECT_INTERNAL(quad.textureCoordinatesEnd(), "Enforce pTextureCoordinates_ != NULL");
    ORVO_EXPECT_INTERNAL(constQuad.textureCoordinatesBegin(), "Enforce pTextureCoordinates_ != NULL");
    ORVO_EXPECT_INTERNAL(constQuad.textureCoordinatesEnd(), "Enforce pTextureCoordinates_ != NULL");
    quad.createTextureCoordinates();
    EXPECT_TRUE(quad.hasTextureCoordinates());
    EXPECT_EQ(std::vector<float2>(4),
              std::vector<float2>(constQuad.textureCoordinatesBegin(), constQuad.textureCoordinatesEnd()));
    *quad.textureCoordinatesBegin() = float2(0.5f, 0.25f);
    EXPECT_EQ(float2(0.5f, 0.25f), *constQuad.textureCoordinatesBegin());
    EXPECT_EQ(4, std::distance(quad.textureCoordinatesBegin(), quad.textureCoordinatesEnd()));
    ORVO_EXPECT_INTERNAL(quad.createTextureCoordinates(), "!hasTextureCoordinates()");
}

TEST(ImageQuadTest, DrawsOnlyInAContext) {
    Core::AutoInitializer const core;
    OGL::AutoInitializer const ogl;
    ImageQuad const quad(PositionInWorldSpace(), ExtentInWorldSpace(1.0f, 1.0f));
    ORVO_EXPECT_OGL(quad.render(), "No OpenGL context is current");
}

std::vector<float> aSent;
void recordCoordinate(GLenum target, GLfloat const* pCoordinate) {
    EXPECT_EQ(static_cast<GLenum>(GL_TEXTURE0), target);
    aSent.insert(aSent.end(), pCoordinate, pCoordinate + 2);
}
void recordVertex(GLfloat const* pVertex) { aSent.insert(aSent.end(), pVertex, pVertex + 2); }

class ImageQuadDrawTest : public GLTest {
protected:
    /// What drawing sends to OpenGL: four numbers a vertex, the texture coordinate and the position.
    static std::vector<float> sent(ImageQuad const& quad) {
        OGL::Texture2D target(OGL::Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, nullptr);
        OGL::Framebuffer framebuffer;
        framebuffer.bind();
        framebuffer.attach(&target, 0, 0);
        auto* const pCoordinate = epoxy_glMultiTexCoord2fv;
        auto* const pVertex = epoxy_glVertex2fv;
        epoxy_glMultiTexCoord2fv = &recordCoordinate;
        epoxy_glVertex2fv = &recordVertex;
        aSent.clear();
        quad.render();
        epoxy_glMultiTexCoord2fv = pCoordinate;
        epoxy_glVertex2fv = pVertex;
        framebuffer.unbind();
        return aSent;
    }
};

TEST_F(ImageQuadDrawTest, SendsEachVertexWithItsCoordinateInOrder) {
    ImageQuad quad(PositionInWorldSpace(-0.5f, -1.0f), ExtentInWorldSpace(1.0f, 1.5f));
    EXPECT_EQ((std::vector<float>{0.0f, 0.0f, -0.5f, -1.0f,  //
                                  0.0f, 0.0f, 0.5f, -1.0f,   //
                                  0.0f, 0.0f, 0.5f, 0.5f,    //
                                  0.0f, 0.0f, -0.5f, 0.5f}), //
              sent(quad));
    quad.createTextureCoordinates();
    auto iCoordinate = quad.textureCoordinatesBegin();
    *iCoordinate++ = float2(0.25f, 0.5f);
    *iCoordinate++ = float2(2.0f, 0.5f);
    *iCoordinate++ = float2(2.0f, -3.0f);
    *iCoordinate++ = float2(0.25f, -3.0f);
    EXPECT_EQ((std::vector<float>{0.25f, 0.5f, -0.5f, -1.0f,   //
                                  2.0f, 0.5f, 0.5f, -1.0f,     //
                                  2.0f, -3.0f, 0.5f, 0.5f,     //
                                  0.25f, -3.0f, -0.5f, 0.5f}), //
              sent(quad));
}

} // namespace

#include "orvo/image_flow/filters/VantleFilterGPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_flow/ScopedTexturePoolAccessors.h"
#include "orvo/image_flow/filters/VantleDataAdapter.h"
#include "orvo/image_flow/filters/VantleShaderAdapter.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO {

namespace {

/// Maps the texture coordinates of unit 0 for a scope: coordinate * scale + offset.
class ScopedTextureMatrix : public StateObject {
public:
    ScopedTextureMatrix(float2 const& scale, float2 const& offset) {
        selectMatrix([&] {
            glPushMatrix();
            glLoadIdentity();
            glTranslatef(offset.x, offset.y, 0.0F);
            glScalef(scale.x, scale.y, 1.0F);
        });
    }
    ~ScopedTextureMatrix() override {
        try {
            if (OGL::NativeContext::currentHandle() != nullptr) {
                selectMatrix([] { glPopMatrix(); });
            }
        } catch (...) { // The context that it was pushed in is gone.
            return;
        }
    }

private:
    template <typename Code>
    static void selectMatrix(Code const& code) {
        OGL::TextureState::setActiveTextureUnit(0);
        GLint nMode = GL_MODELVIEW;
        glGetIntegerv(GL_MATRIX_MODE, &nMode);
        glMatrixMode(GL_TEXTURE);
        code();
        glMatrixMode(static_cast<GLenum>(nMode));
    }
};

} // namespace

VantleFilterGPU::VantleFilterGPU()
    : BasicGLShaderFilter("VantleFilterGPU", "", 4),
      vantleTransform_(DataFlow::Parameter<void*>::create(nullptr, "Transform", "Colour transform")),
      vantleOptions_(
          DataFlow::Parameter<void*>::create(nullptr, "Vantle Options", "Options of the colour engine")),
      pLastTransform_(nullptr),
      greyResult_(DataFlow::Parameter<bool>::create(false, "Grey Result", "Hands green on in all channels")),
      bLastGreyResult_(false),
      bDescribed_(false),
      nPopulatedFrom_(0) {
    addInput("InputImage");
    addParameter(vantleTransform_);
    addParameter(vantleOptions_);
    addParameter(greyResult_);
}

VantleFilterGPU::~VantleFilterGPU() = default;

bool VantleFilterGPU::isCompatible(VantleTransform* transform) {
    VantleShaderAdapter adapter(transform, nullptr);
    return adapter.isValid() && VantleDataAdapter::canCreateGLObjectsAsRequested(adapter);
}

std::shared_ptr<DataFlow::Parameter<void*>> VantleFilterGPU::transform() const {
    ORVO_ENFORCE(vantleTransform_.get());
    return vantleTransform_;
}

std::shared_ptr<DataFlow::Parameter<void*>> VantleFilterGPU::options() const {
    ORVO_ENFORCE(vantleOptions_.get());
    return vantleOptions_;
}

std::shared_ptr<DataFlow::Parameter<bool>> VantleFilterGPU::greyResult() const { return greyResult_; }

std::string VantleFilterGPU::initVantle(VantleTransform* transform) {
    nPopulatedFrom_ = 0;
    spDataAdapter_.reset();
    spShaderAdapter_ = transform != nullptr ? std::make_shared<VantleShaderAdapter>(transform, nullptr)
                                            : std::make_shared<VantleShaderAdapter>();
    auto const spDataAdapter = std::make_shared<VantleDataAdapter>(spShaderAdapter_.get());
    bCompiled_ = VantleDataAdapter::canCreateGLObjectsAsRequested(*spShaderAdapter_);
    pLastTransform_ = this->transform()->value();
    bLastGreyResult_ = greyResult_->value();
    bDescribed_ = spShaderAdapter_->isValid();
    spDataAdapter->setGreyResult(bLastGreyResult_);
    std::string sText = spDataAdapter->buildGLObjects();
    spDataAdapter_ = spDataAdapter;
    return sText;
}

bool VantleFilterGPU::isUpToDate() const {
    void* const pTransform = transform()->value();
    if (!spDataAdapter_ || pTransform != pLastTransform_ || greyResult_->value() != bLastGreyResult_) {
        return false;
    }
    if (bDescribed_) {
        return spShaderAdapter_->isValid();
    }
    // The engine had no shader. Interfaces go and come under a running system, and without a reference on it
    // the same address may be another engine's transform by now.
    return !VantleShaderAdapter(static_cast<VantleTransform*>(pTransform), nullptr).isValid();
}

void VantleFilterGPU::followTransform() {
    if (isUpToDate()) {
        return;
    }
    void* const pTransform = transform()->value();
    oProgram_.removeAllShaders();
    try {
        std::string const sText = initVantle(static_cast<VantleTransform*>(pTransform));
        if (sText != sFragmentSource_) {
            sFragmentSource_ = sText;
        }
        compilePrograms();
    } catch (...) {
        // So that the next frame tries again.
        spDataAdapter_.reset();
        throw;
    }
    bCompiled_ = true;
}

void VantleFilterGPU::preProcess() {
    followTransform();
    BasicGLShaderFilter::preProcess();
    if (nPopulatedFrom_ == texUnitCount_) {
        return;
    }
    try {
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        lock.getProgram()->enable();
        nPopulatedFrom_ = 0;
        spDataAdapter_->populateGLObjects(static_cast<unsigned>(texUnitCount_));
        nPopulatedFrom_ = texUnitCount_;
    } catch (...) {
        abandonPass();
        throw;
    }
}

void VantleFilterGPU::internalProcess() {
    ORVO_ENFORCE(spDataAdapter_.get());
    auto const apStateStack = std::make_unique<GLStateStack>();
    ORVO_ENFORCE(apStateStack.get());
    try {
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        OGL::Program& program = *lock.getProgram();
        program.enable();
        apStateStack->push_back(ORVO_NEW ScopedActiveTextureUnitRestore());
        if (bDescribed_) {
            bindTables(*apStateStack, program);
            setMatrices(program);
        } else {
            showInput(*apStateStack, program);
        }
    } catch (...) {
        abandonPass();
        throw;
    }
    BasicGLShaderFilter::internalProcess();
}

void VantleFilterGPU::bindTables(GLStateStack& states, OGL::Program& program) const {
    auto const& tex1D = spDataAdapter_->textures1D();
    for (auto tex1DIter = tex1D.begin(); tex1DIter != tex1D.end(); ++tex1DIter) {
        unsigned const textureUnit = tex1DIter->second.second;
        ORVO_CHECK(textureUnit > 0);
        ORVO_ENFORCE(tex1DIter->second.first);
        ORVO_ENFORCE(tex1DIter->second.first->get());
        ORVO_CHECK(!tex1DIter->first.empty());
        states.push_back(ORVO_NEW ScopedTexture1DEnablerWithActivation(textureUnit));
        states.push_back(
            ORVO_NEW ScopedTexture1DBindUnbindWithActivation(textureUnit, tex1DIter->second.first->get()));
        program.setUniformSampler1D_Unsafe(tex1DIter->first.c_str(), static_cast<int>(textureUnit));
    }
    auto const& tex2D = spDataAdapter_->textures2D();
    for (auto tex2DIter = tex2D.begin(); tex2DIter != tex2D.end(); ++tex2DIter) {
        unsigned const textureUnit = tex2DIter->second.second;
        ORVO_CHECK(textureUnit > 0);
        ORVO_ENFORCE(tex2DIter->second.first);
        ORVO_ENFORCE(tex2DIter->second.first->get());
        ORVO_CHECK(!tex2DIter->first.empty());
        states.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(textureUnit));
        states.push_back(
            ORVO_NEW ScopedTexture2DBindUnbindWithActivation(textureUnit, tex2DIter->second.first->get()));
        program.setUniformSampler2D_Unsafe(tex2DIter->first.c_str(), static_cast<int>(textureUnit));
    }
    auto const& tex3D = spDataAdapter_->textures3D();
    for (auto tex3DIter = tex3D.begin(); tex3DIter != tex3D.end(); ++tex3DIter) {
        unsigned const textureUnit = tex3DIter->second.second;
        ORVO_CHECK(textureUnit > 0);
        ORVO_ENFORCE(tex3DIter->second.first);
        ORVO_ENFORCE(tex3DIter->second.first->get());
        ORVO_CHECK(!tex3DIter->first.empty());
        states.push_back(ORVO_NEW ScopedTexture3DEnablerWithActivation(textureUnit));
        states.push_back(
            ORVO_NEW ScopedTexture3DBindUnbindWithActivation(textureUnit, tex3DIter->second.first->get()));
        program.setUniformSampler3D_Unsafe(tex3DIter->first.c_str(), static_cast<int>(textureUnit));
    }
}

void VantleFilterGPU::setMatrices(OGL::Program& program) const {
    auto const& mat3 = spDataAdapter_->matrices3();
    for (auto mat3Iter = mat3.begin(); mat3Iter != mat3.end(); ++mat3Iter) {
        ORVO_CHECK(!mat3Iter->first.empty());
        ORVO_ENFORCE(mat3Iter->second.data(), "&mat3Iter->second[ 0 ]");
        program.setUniformMatrix3_Unsafe(mat3Iter->first.c_str(), mat3Iter->second.data(), GL_FALSE);
    }
    auto const& mat4 = spDataAdapter_->matrices4();
    for (auto mat4Iter = mat4.begin(); mat4Iter != mat4.end(); ++mat4Iter) {
        ORVO_CHECK(!mat4Iter->first.empty());
        ORVO_ENFORCE(mat4Iter->second.data(), "&mat4Iter->second[ 0 ]");
        program.setUniformMatrix4_Unsafe(mat4Iter->first.c_str(), mat4Iter->second.data(), GL_FALSE);
    }
}

void VantleFilterGPU::showInput(GLStateStack& states, OGL::Program& program) const {
    ImageGPU const* const pInput = inputImageGPU(0);
    ORVO_ENFORCE(pInput);
    ORVO_ENFORCE(pOutputImage_);
    program.setUniformSampler2D_Unsafe(spDataAdapter_->getInputSamplerName().c_str(), pInput->boundTexUnit());
    // The coordinates of the pass count the output's pixels; this program reads the input's texture with them
    // as they are.
    PixelExtentInWorldSpace const pixelExtent = pOutputImage_->pixelExtent();
    PositionInWorldSpace const outOffset = pixelToWorldSpace(pOutputImage_->position(), pixelExtent);
    PositionInWorldSpace const offset = pixelToWorldSpace(pInput->position(), pInput->pixelExtent());
    ExtentInWorldSpace const size = pixelToWorldSpace(pInput->capacityExtent(), pInput->pixelExtent());
    states.push_back(ORVO_NEW ScopedTextureMatrix(
        float2(pixelExtent.width() / size.width(), pixelExtent.height() / size.height()),
        float2((outOffset.x() - offset.x()) / size.width(), (outOffset.y() - offset.y()) / size.height())));
}

} // namespace ORVO

#include "orvo/image_flow/filters/DisplayFilterGPU.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/bilateral/GPUPrograms.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO {

DisplayFilterGPU::DisplayFilterGPU(char const* name)
    : SimpleFilterGPU(name), bRunInHardware_(true), pProgramOfPass_(nullptr) {}

DisplayFilterGPU::~DisplayFilterGPU() = default;

bool DisplayFilterGPU::willRunInHardware() { return bRunInHardware_; }

void DisplayFilterGPU::addSources(ShaderProgramProxyOGL& oProgram, char const* pFragmentSource) {
    oProgram.add(VertexShaderSourceOGL(ImageFlow::bilateral::passThroughVertexProgram()));
    oProgram.add(FragmentShaderSourceOGL(pFragmentSource));
}

void DisplayFilterGPU::link(ShaderProgramProxyOGL& oProgram) {
    ShaderManagerOGL* const pManager = ShaderManagerOGL::Instance();
    ORVO_ENFORCE(pManager);
    pManager->RegisterShaderProgram(&oProgram);
}

ImageGPU const& DisplayFilterGPU::inputImage() const {
    ImageGPU const* const pImage = inputImageGPU(0);
    ORVO_ENFORCE(pImage);
    return *pImage;
}

int DisplayFilterGPU::bindNearest(ImageGPU const& image, unsigned unit) {
    // An image that feeds two inputs keeps its one unit.
    if (image.boundTexUnit() < 0) {
        image.bind(unit);
        image.setFilter(GL_NEAREST, GL_NEAREST);
        image.setWrap(GL_CLAMP_TO_EDGE, GL_CLAMP_TO_EDGE);
    }
    return image.boundTexUnit();
}

void DisplayFilterGPU::bindInputs() {
    inputImage().enable(0);
    bindNearest(inputImage(), 0);
}

ShaderProgramProxyOGL& DisplayFilterGPU::programOfPass() { return oProgram_; }

void DisplayFilterGPU::preProcess() {
    SimpleFilterGPU::preProcess();
    try {
        bindInputs();
        oProgram_.LockOglProgram();
        pProgramOfPass_ = &programOfPass();
        OGL::Program& program = *pProgramOfPass_->LockOglProgram();
        program.enable();
        setUniforms(program);
    } catch (...) {
        abandonPass();
        throw;
    }
}

void DisplayFilterGPU::postProcess() {
    try {
        oProgram_.LockOglProgram()->disable();
        SimpleFilterGPU::postProcess();
    } catch (...) {
        unlockPrograms();
        throw;
    }
    unlockPrograms();
}

void DisplayFilterGPU::abandonPass() noexcept {
    try {
        if (OGL::NativeContext::currentHandle() != nullptr) {
            glUseProgram(0);
        }
    } catch (...) { // The context that the pass ran in is gone, and with it what was enabled there.
    }
    unlockPrograms();
    SimpleFilterGPU::abandonPass();
}

void DisplayFilterGPU::unlockPrograms() noexcept {
    if (pProgramOfPass_ != nullptr) {
        pProgramOfPass_->UnlockOglProgram();
        pProgramOfPass_ = nullptr;
    }
    oProgram_.UnlockOglProgram();
}

} // namespace ORVO

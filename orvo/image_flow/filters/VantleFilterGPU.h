#pragma once

#include "orvo/colour_engine/VantleHandles.h"
#include "orvo/core/Export.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

#include <memory>
#include <string>

namespace ORVO {

class GLStateStack;
class VantleDataAdapter;
class VantleShaderAdapter;

/// A colour transform of the colour engine on the GPU: one pass over the image input "InputImage", into an
/// output of four channels. Alpha stays as it is.
///
///     if (VantleFilterGPU::isCompatible(pTransform)) {
///         filter.transform()->setValue(pTransform);
///         ...
///
/// The parameter "Transform" holds the `VantleTransform*`, on which the filter keeps a reference of its own
/// from the frame on that first runs with it. A null transform, and one that the engine has no shader for,
/// draw the input with a red diagonal; in the second case each run asks the engine again, which may have come
/// back. The parameter "Vantle Options" is there for hosts; changing it rebuilds nothing.
///
/// Where the parameter "Grey Result" is set, the green result goes into red, green and blue: a picture of one
/// or two channels is read from red, and grey through a transform is green at its end, as on the CPU.
///
/// The program is generated and the tables are made when a frame finds another transform than the last one
/// did, or another binding of an engine, or "Grey Result" changed. Other frames ask the engine for nothing,
/// link nothing and make no texture.
///
/// Threads: as BasicGLShaderFilter. All frames run in contexts of one share group.
class ORVO_API VantleFilterGPU : public BasicGLShaderFilter {
public:
    /// A filter without a transform.
    VantleFilterGPU();
    ~VantleFilterGPU() override;

    /// Whether this filter can run the transform in the current context. Where it cannot, a host takes
    /// VantleFilterCPU. Throws what the engine refuses once it has given its shader, as VantleShaderAdapter.
    static bool isCompatible(VantleTransform* transform);

    /// The parameter "Transform". Throws InternalException "Enforce vantleTransform_.get() != NULL".
    std::shared_ptr<DataFlow::Parameter<void*>> transform() const;
    /// The parameter "Vantle Options". Throws InternalException "Enforce vantleOptions_.get() != NULL".
    std::shared_ptr<DataFlow::Parameter<void*>> options() const;
    /// The parameter "Grey Result", false at first.
    std::shared_ptr<DataFlow::Parameter<bool>> greyResult() const;

protected:
    /// Makes the adapters for a transform, null for none, and answers the text of the program.
    /// willRunInHardware() then tells whether the current context can run it, until a frame has compiled it.
    std::string initVantle(VantleTransform* transform);

    /// Follows a changed transform; then as BasicGLShaderFilter. Throws also what the engine refuses, and
    /// what VantleDataAdapter throws; the next frame tries again.
    void preProcess() override;
    /// Binds tables and matrices, draws, and unbinds. Throws also "Enforce spDataAdapter_.get() != NULL",
    /// "textureUnit > 0", "!tex1DIter->first.empty()" (2D, 3D), "!mat3Iter->first.empty()" (4). A table
    /// without a texture and a matrix without values, which VantleDataAdapter never keeps, would be "Enforce
    /// tex1DIter->second.first != NULL" (2D, 3D), "internalTexture_ != NULL" and "Enforce &mat3Iter->second[
    /// 0 ] != NULL" (4).
    void internalProcess() override;

    std::shared_ptr<DataFlow::Parameter<void*>> vantleTransform_;
    std::shared_ptr<DataFlow::Parameter<void*>> vantleOptions_;
    /// Before the data adapter, which reads it.
    std::shared_ptr<VantleShaderAdapter> spShaderAdapter_;
    std::shared_ptr<VantleDataAdapter> spDataAdapter_;
    /// What the adapters were built from.
    void* pLastTransform_;

private:
    bool isUpToDate() const;
    void followTransform();
    void bindTables(GLStateStack& states, OGL::Program& program) const;
    void setMatrices(OGL::Program& program) const;
    void showInput(GLStateStack& states, OGL::Program& program) const;

    std::shared_ptr<DataFlow::Parameter<bool>> greyResult_;
    bool bLastGreyResult_;
    /// Whether the program is the engine's, and not the diagonal.
    bool bDescribed_;
    /// The first unit of the textures that the data adapter has made; 0 if there are none.
    int nPopulatedFrom_;
};

} // namespace ORVO

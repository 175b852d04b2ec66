#pragma once

#include "orvo/colour_engine/VantleHandles.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/core/Export.h"

#include <cstdint>
#include <string>

namespace ORVO {

/// The colour engine's description of a transform as a shader: the text of an entry function, and the tables
/// and matrices that it reads. Holds one reference on the transform and one on the engine's shader object,
/// both of them the engine's that was bound when the adapter was made.
///
///     VantleShaderAdapter adapter(pTransform, nullptr);
///     if (adapter.isValid())
///         adapter.getShaderInfo(sEntryPoint, sCode);
///
/// On an adapter that is not valid every operation but isValid() throws InternalException "vantleShader_ !=
/// NULL". What the engine refuses is thrown as Quor_T_MT::CQuorError, its absence as TrelException. An
/// adapter that outlives the binding is not valid from the next start of a binding on: what it holds is not
/// handed to the engine bound then. An engine that replaces another while the binding stands, as the counter
/// of unregistered interfaces tells, is given these handles.
///
/// Threads: one at a time.
class ORVO_API VantleShaderAdapter {
public:
    /// An adapter that is not valid.
    VantleShaderAdapter();
    /// Takes a reference on the transform and asks the engine for its shader. Null, and every failure of the
    /// engine, its absence included, gives an adapter that is not valid.
    /// @param options handed to the engine; may be null.
    VantleShaderAdapter(VantleTransform* transform, _t_Vantle_Options const* options);
    VantleShaderAdapter(VantleShaderAdapter const&) = delete;
    VantleShaderAdapter& operator=(VantleShaderAdapter const&) = delete;
    /// Drops both references, or lets them go where the engine that they came from is no longer bound.
    /// Nothing leaves it.
    virtual ~VantleShaderAdapter();

    /// Whether the engine delivered a shader and no other binding was started since.
    virtual bool isValid();
    /// The name of the entry function and the text that holds it. Both stay as they were if it throws.
    virtual void getShaderInfo(std::string& entryPoint, std::string& code);
    /// The description of a table or matrix; its field `name` is null. The texels that it points to are the
    /// engine's and live as long as the adapter.
    /// @param name the name of its uniform.
    virtual _t_Vantle_ShaderParameterData getParameter(unsigned index, std::string& name);
    /// Copies the values of a matrix, column by column.
    /// @param target room for 16 floats.
    /// @param size the bytes that the matrix has; if there are more than there is room for, nothing is
    /// copied.
    virtual void copyMatrixData(float* target, unsigned index, unsigned& size);
    /// How many tables and matrices there are.
    virtual unsigned numParameters();

private:
    bool isBound() const noexcept;
    void release() noexcept;

    std::uint32_t iGeneration_; ///< of the binding that both handles belong to
    VantleTransform* vantleTransform_ = nullptr;
    VantleShader* vantleShader_ = nullptr;
};

} // namespace ORVO

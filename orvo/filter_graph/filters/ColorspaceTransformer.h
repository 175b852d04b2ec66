#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"

#include <memory>

namespace ORVO::FilterGraph::Internal::Filters {

/// The colour transform as a host sees it: one filter with the input "src" and the parameters "srcProfile"
/// and "dstProfile" (int), codes of colour spaces that the colour engine knows; the default of both is
/// 0x41533938, a wide-gamut RGB space. It has no node of its own: in the processor's copy of the graph it is
/// replaced by the node that suits the options.
///
/// On the CPU images have 8-bit or 16-bit channels in R, G, B, A order or grey; on OpenGL any that frames
/// take. Grey goes through a transform as equal parts of red, green and blue, and a grey result is the green
/// one: on the CPU where the image that is written has one or two channels, on OpenGL, where images between
/// filters have at least three, where the image that the graph ends in has them or, if another transform
/// follows, the image that comes in.
///
/// Threads: as Filter.
class ORVO_API ColorspaceTransformer : public Filter {
public:
    class Forwarder;

    /// Identifier: name "ColorspaceTransformer", nameSpace "com.norvane.orvo", vendor "Norvane", version 1.
    ColorspaceTransformer();
    /// Copies the filter's interface and values, without connections; a node stays that of both, until one of
    /// them is unfolded again.
    ColorspaceTransformer(ColorspaceTransformer const& other);
    ~ColorspaceTransformer() override;

    std::shared_ptr<Filter> clone() override;

    /// Puts the node filter "VantleFilterGPU", which for CPU_PROCESSING is one of the CPU, between this
    /// filter's producer and its consumers, and leaves this filter without connections; it keeps the node
    /// filter alive. On OpenGL "Grey Result" of the node is set by the channels of the adapters that are
    /// connected.
    /// @return a Forwarder, for which this filter has to stay alive.
    /// @throws InternalException "producer" if the input has no producer, "vantleNode_g->isInitialized()",
    ///         "vantleNode_c->isInitialized()", "Enforce output != NULL".
    std::shared_ptr<ParameterForwarder> unFold(OptimizationOptions const& options) override;

    /// An empty pointer: the filter is always unfolded first.
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                             GraphExecutable& graphExecutable) override;

private:
    Filter* node() const noexcept;

    std::shared_ptr<Filter> vantleNode_g;
    std::shared_ptr<Filter> vantleNode_c;
};

/// Turns the two codes into a transform of the colour engine before each frame, and hands that to the node.
///
/// Threads: as ParameterForwarder.
class ORVO_API ColorspaceTransformer::Forwarder : public ParameterForwarder {
public:
    /// @param transformer not owned, has to outlive this object.
    explicit Forwarder(ColorspaceTransformer& transformer);
    ~Forwarder() override;

    /// Makes the transform of the two codes, with the perceptual intent, and sets it as "Transform" of the
    /// node; then runs the children. The pairs of parameters are not run. The reference on the transform goes
    /// on to the node as a plain pointer and is never dropped: the engine gives the same transform for the
    /// same codes.
    /// @throws InternalException "Enforce vantleNode_g != NULL" for a transformer that was never unfolded,
    ///         before the engine is asked for anything; "Cannot make src profile from code" for a source that
    ///         the engine does not know, and where there is no engine; "Cannot make dst profile from code";
    ///         "Cannot transform from source colorspace to destination colorspace"; "Cannot optimize the
    ///         colorspace transformation". The node then keeps the transform that it has.
    void forwardStuff() override;

private:
    ColorspaceTransformer* pTransformer_;
};

} // namespace ORVO::FilterGraph::Internal::Filters

#pragma once

#include <array>
#include <cstddef>

namespace ORVO {

namespace OGL {
class Context;
}

/// What a frame changes in its context, which is current, put back at the end of a scope: texture units,
/// matrices, viewport, program, framebuffers, arrays, pixel buffers, and how pixels are drawn, which is made
/// plain for the frame. A host may have named a context in which it draws itself: whatever it has set there
/// changes no pixel of the frame, and is set again after it, also where the frame fails.
///
/// Not looked at is what cannot reach the frame's targets, textures with one sample a pixel and without
/// sRGB: the coverage of samples, the conversion to sRGB, lines, depth. Neither are a conditional render or a
/// transform feedback that the host has begun: it ends them before it asks for a frame.
///
/// Threads: the one on which the context is current.
class FrameState {
public:
    explicit FrameState(OGL::Context const& context);
    /// Makes the context current, where another one is; if the driver refuses, its state is gone with it.
    ~FrameState();
    FrameState(FrameState const&) = delete;
    FrameState& operator=(FrameState const&) = delete;

private:
    /// What the driver has: asking for anything else is an error.
    struct Driver {
        Driver();

        bool bRectangles_;
        bool bPrograms_;
        bool bVertexAssembly_;
        bool bFragmentAssembly_;
        bool bSeparateFramebuffers_;
        bool bPixelBuffers_;
        bool bClampedColors_;
        bool bDiscards_;
        bool bSamplers_;
        bool bPipelines_;
        bool bClipControl_;
        unsigned nVersion_; ///< ten times the major one, and the minor one
    };

    /// More units than any driver reads.
    static constexpr std::size_t nMostUnits_ = 64;

    void save();
    void makeDrawingPlain();
    void makeUnitsPlain();
    void makeArraysPlain() const;
    void restore() const noexcept;

    OGL::Context const& context_;
    Driver const oDriver_;
    std::array<double, 16> aProjection_{};
    std::array<double, 16> aModelview_{};
    std::array<double, 16> aTexture_{}; ///< of unit 0, the one whose coordinates are used
    std::array<double, 4> aColor_{};
    bool bSumsColors_ = false;
    int nDraw_ = 0;
    int nRead_ = 0;
    int nProgram_ = 0;
    int nPipeline_ = 0;
    int nUnpackBuffer_ = 0;
    int nPackBuffer_ = 0;
    std::array<int, 3> aClamps_{}; ///< of vertices, of fragments, of what is read
    bool bDiscards_ = false;
    std::size_t nUnits_ = 0;
    std::array<int, nMostUnits_> aSamplers_{};
};

} // namespace ORVO

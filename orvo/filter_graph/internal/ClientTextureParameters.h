#pragma once

#include <array>
#include <vector>

namespace ORVO::OGL {
class Texture2D;
} // namespace ORVO::OGL

namespace ORVO::FilterGraph::Internal {

/// How a host has its textures sampled: filters, wrap modes and border colour. Shader filters set these on
/// the textures that they read; over a frame they are kept here, so that the host finds them as they were.
///
/// Threads: one at a time, with a context of the textures' group current.
class ClientTextureParameters {
public:
    ClientTextureParameters();
    ClientTextureParameters(ClientTextureParameters const&) = delete;
    ClientTextureParameters& operator=(ClientTextureParameters const&) = delete;
    /// Puts back what is still kept.
    ~ClientTextureParameters();

    /// Notes the parameters of a texture, which must live until they are put back. Does nothing if no context
    /// is current.
    void keep(OGL::Texture2D const& texture);
    /// Whether nothing is kept.
    bool empty() const noexcept { return aKept_.empty(); }
    /// Sets all textures to what was noted, and forgets them. Does nothing if no context is current.
    void putBack() noexcept;

private:
    struct Parameters {
        unsigned nTexture_;
        int nMinFilter_;
        int nMagFilter_;
        int nWrapS_;
        int nWrapT_;
        std::array<float, 4> aBorderColor_;
    };

    std::vector<Parameters> aKept_;
};

} // namespace ORVO::FilterGraph::Internal

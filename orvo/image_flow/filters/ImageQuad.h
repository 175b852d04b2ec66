#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/spaces/ExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionInWorldSpace.h"

#include <cstddef>
#include <memory>
#include <vector>

namespace ORVO {

/// The rectangle that a pass draws: four vertices and, once created, a texture coordinate for each. The units
/// are those of the projection that the pass sets up.
///
/// Threads: a plain object; render() with a current context.
class ORVO_API ImageQuad {
public:
    using const_vertex_iterator = std::vector<PositionInWorldSpace>::const_iterator;
    using vertex_iterator = std::vector<PositionInWorldSpace>::iterator;
    using const_coordinate_iterator = std::vector<float2>::const_iterator;
    using coordinate_iterator = std::vector<float2>::iterator;

    /// A quad without texture coordinates. Throws as set().
    ImageQuad(PositionInWorldSpace const& rPosition, ExtentInWorldSpace const& rSize);
    ImageQuad(ImageQuad const&) = delete;
    ImageQuad& operator=(ImageQuad const&) = delete;
    virtual ~ImageQuad();

    /// Draws the quad, each vertex with its coordinate on texture unit 0, or with (0, 0) without coordinates.
    /// @throws OGL::ExceptionOGL "No OpenGL context is current".
    virtual void render() const;

    /// Sets the vertices in the order position, position + (width, 0), position + size, position +
    /// (0, height). Texture coordinates stay.
    /// @throws InternalException "0.f <= rSize.width() && 0.f <= rSize.height()"; the vertices stay.
    void set(PositionInWorldSpace const& rPosition, ExtentInWorldSpace const& rSize);

    /// Vertex 0.
    PositionInWorldSpace const& lowerLeft() const noexcept { return vVertices_.front(); }
    /// Vertex 2 less vertex 0.
    ExtentInWorldSpace size() const noexcept;
    /// Always four.
    std::size_t numberOfVertices() const noexcept { return vVertices_.size(); }

    /// Makes a texture coordinate of (0, 0) for each vertex.
    /// @throws InternalException "!hasTextureCoordinates()".
    void createTextureCoordinates();
    bool hasTextureCoordinates() const noexcept { return pTextureCoordinates_ != nullptr; }

    /// \name The vertices, and the texture coordinates in the same order
    /// Those of the coordinates throw InternalException "Enforce pTextureCoordinates_ != NULL" before these
    /// are created.
    /// @{
    const_vertex_iterator verticesBegin() const noexcept { return vVertices_.begin(); }
    const_vertex_iterator verticesEnd() const noexcept { return vVertices_.end(); }
    vertex_iterator verticesBegin() noexcept { return vVertices_.begin(); }
    vertex_iterator verticesEnd() noexcept { return vVertices_.end(); }
    const_coordinate_iterator textureCoordinatesBegin() const;
    const_coordinate_iterator textureCoordinatesEnd() const;
    coordinate_iterator textureCoordinatesBegin();
    coordinate_iterator textureCoordinatesEnd();
    /// @}

private:
    std::vector<PositionInWorldSpace> vVertices_;
    std::unique_ptr<std::vector<float2>> pTextureCoordinates_;
};

} // namespace ORVO

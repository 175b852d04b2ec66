#pragma once

#include <cstdint>

namespace ORVO {

/// What the colour engine hands out. Each is an opaque, reference-counted object of the engine: it is never
/// looked into, only given back to the engine's procedures. Their counts are kept by the engine; who holds a
/// handle drops it with the matching `UnReference...` (a shader, which is a container object, with `Release`
/// of the container interface).
struct VantleProfile;
struct VantleTransform;
struct VantleShader;
struct VantleString;

/// Options of an engine's own; null for none.
struct _t_Vantle_Options;

/// Objects of the interface layer below the engine.
struct QuorContainer;
struct QuorError;
struct QuorStringAtom;

/// What every procedure returns: 0 for success, anything else is the handle of a `QuorError` that the engine
/// owns. Who keeps such an error beyond the next call takes a reference.
using VantleResult = std::uint64_t;

} // namespace ORVO

#pragma once

#include "orvo/core/Export.h"

namespace ORVO::FilterGraph {

/// Registers the filters that come with the library with FilterFactory::Instance(), so that a host creates
/// them by name:
///
/// name space and vendor "Motion Loft", "Norvane Works":
/// - "FastBilateralBlur": the bilateral filter that suits the processing mode, the grid on either target.
///
/// name space and vendor "com.norvane.orvo", "Norvane":
/// - "ColorspaceTransformer": from one colour space to another, by the node that suits the processing mode.
///
/// name space and vendor "ImageFlow", "Norvane":
/// - "FastBilateralFilter": the bilateral grid node by itself, of OpenGL where the library was started with a
///   context, else of the CPU. Of OpenGL it filters colours as they stand, without regard to alpha,
/// - "SimpleBilateralCPU": the direct bilateral filter,
/// - "RGBToLABCPU", "LABToRGBCPU": conversion of sRGB to scaled Lab and back,
/// - "VantleFilterCPU": the node of colour transforms on the CPU, for transforms that the host has made
///   ("VantleFilterGPU" is the one of Library::insertORVOFilters),
/// - "ConvertToSIMDOptimized": 8-bit or 16-bit integers to 32-bit float,
/// - "ConvertFromSIMDOptimized": 32-bit float to the depth of the output image,
/// - "MirelCheckerBoardGPU", "MirelGamutComposite", "MirelToneMappingGPU": previews for the screen, on OpenGL
///   alone. Where the library was started without OpenGL, the first two have neither inputs nor parameters.
///
/// name space and vendor "ORVO", "Norvane", on OpenGL alone:
/// - "premultiply", "unpremultiply": colour times alpha, and back,
/// - "scaleUp1channel" to "scaleUp4channel": 16-bit integers of the scale 0..32768 to OpenGL's 0..65535,
/// - "scaleDown1channel" to "scaleDown4channel": back. A processor puts these two kinds itself where images
///   of `CHANNEL_TYPE_UINT15_1` meet a graph on OpenGL. On textures of two channels the result has four.
///
/// All have version 1. The simple bilateral and Lab filters and the converters run on the CPU alone. Those of
/// the CPU read and write 8-bit and float images (colour transforms 8-bit and 16-bit ones), and every filter
/// works in the depth of the image that its graph ends in. A host with 16-bit images puts
/// "ConvertToSIMDOptimized" in front of the others, ends the graph in a float image, and brings that back to
/// 16 bits with a graph that has no filter between input and output.
///
/// Library::initialize does not call this.
/// @throws Exception if one of them is registered already, InternalException "isInitialized()" while the
/// library is down; the factory is then as it was.
///
/// Threads: as the factory, from one thread at a time.
ORVO_API void insertStandardFilters();

/// Removes what insertStandardFilters registered; filters made from them stay alive. Library::terminate
/// removes all prototypes by itself.
/// @throws InternalException "iter != aFilters_.end()" if one of them is not registered; nothing is removed
/// then.
///
/// Threads: as the factory, from one thread at a time.
ORVO_API void removeStandardFilters();

} // namespace ORVO::FilterGraph

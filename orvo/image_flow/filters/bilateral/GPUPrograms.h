#pragma once

#include <string>

/// The texts of the programs of the bilateral grid on OpenGL.
///
/// Threads: any.
namespace ORVO::ImageFlow::bilateral {

/// Passes position and texture coordinate on.
std::string passThroughVertexProgram();
/// Puts a pixel into its cell: gl_Vertex is its place in the region, gl_Color its colour. What is summed up
/// goes to gl_TexCoord[0]: the luminance, or L, a and b, the latter two moved into 0..1.
std::string scatterVertexProgram(bool bLab);
/// Thousandths of what the vertex program put out, and a thousandth of weight.
std::string scatterFragmentProgram();
/// Seven taps of the Gaussian bell, `delta` apart.
std::string blurFragmentProgram();
/// The same, then divided by the weight; 0 where that is 0.
std::string blurAndDivideFragmentProgram();
/// Reads each pixel's result between the eight cells around it.
/// @param bHardwareFilters whether the texture unit is set to filter the grid's textures linearly; else it
///        reads single cells, and the program mixes them.
std::string sliceFragmentProgram(bool bLab, bool bHardwareFilters);

} // namespace ORVO::ImageFlow::bilateral

#pragma once

namespace ORVO::ImageFlow::bilateral {

struct SimpleJob;

// One kernel a translation unit, each built with the flags of its instruction set. To be called only where
// the processor has the instructions.
void simpleRowSSE2(SimpleJob const& job);
void simpleRowAVX2(SimpleJob const& job);
void simpleRowAVX512(SimpleJob const& job);

} // namespace ORVO::ImageFlow::bilateral

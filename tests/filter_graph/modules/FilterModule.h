#pragma once

namespace ORVO::Test {

// What the module `FilterModule` exports, all by C names.

/// "insertModuleFilter", "removeModuleFilter": a prototype "module filter" of the name space "test" and the
/// vendor "ORVO", version 1, whose class the module keeps to itself: an input "src" with 3 channels, the
/// parameters "offset" (`float2`, (1, 2)) and "title" (`std::string`, "module"), and a metadata item "Corner"
/// (`float3`, (1, 2, 3)). All filters of this kind must be gone before the module is.
using ChangeFactory = void (*)();

/// "throwInModule": throws a `FilterGraph::Exception` of an error "from the module" and a warning "and more".
using ThrowInModule = void (*)();

/// "catchInModule": whether the module recognises, as what they are, a failed check of the factory and a
/// channel mismatch.
using CatchInModule = bool (*)();

} // namespace ORVO::Test

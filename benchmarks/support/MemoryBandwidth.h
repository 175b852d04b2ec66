#pragma once

#include <cstddef>

namespace ORVO::Benchmarks {

/// Registers the benchmark "memcpy/<bytes>": a copy of `bytes` bytes between blocks that have been touched
/// before. Its rate counts the bytes read plus the bytes written, as every rate in these programs does, so
/// that the table can set the two against each other. Call it with the sizes that the program's own work
/// moves.
void registerMemcpy(std::size_t bytes);

} // namespace ORVO::Benchmarks

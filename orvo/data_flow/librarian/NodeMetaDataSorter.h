#pragma once

#include "orvo/core/Export.h"

namespace ORVO::DataFlow {

class NodeMetaData;

/// Strict order of node types: vendor, then namespace, then name, as strings, then the version as an unsigned
/// number. A record without a version counts as version 0.
///
/// Threads: any.
class ORVO_API NodeMetaDataSorter {
public:
    /// Whether the left record stands before the right one. The pointers must not be null.
    bool operator()(NodeMetaData const* pLeft, NodeMetaData const* pRight) const;
    /// The same order.
    bool operator()(NodeMetaData const& left, NodeMetaData const& right) const;
};

} // namespace ORVO::DataFlow

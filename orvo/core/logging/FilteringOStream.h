#pragma once

#include <ostream>

#include "orvo/core/logging/FilteringOutputStreambuf.h"

namespace ORVO::Logging {

/// A stream on the stream buffer of another stream, with an Inserter between: what a dump is written through.
///
///     void debugWrite(std::ostream& stream) const {
///         Logging::FilteringOStream<Logging::LoggingInserter> indented(stream);
///         indented.setIndent(2);
///         indented << child; // each line of it stands two blanks further right
///     }
///
/// Takes over the other stream's number formats and locale. The other stream must outlive it.
///
/// Threads: one at a time.
template <typename Inserter>
class FilteringOStream : public std::ostream {
public:
    explicit FilteringOStream(std::ostream& stream) : std::ostream(nullptr), oBuffer_(stream.rdbuf()) {
        rdbuf(&oBuffer_);
        flags(stream.flags());
        precision(stream.precision());
        fill(stream.fill());
        imbue(stream.getloc());
    }

    /// On a stream of this very class: nests, rather than copies.
    explicit FilteringOStream(FilteringOStream& stream)
        : FilteringOStream(static_cast<std::ostream&>(stream)) {}

    Inserter& inserter() noexcept { return oBuffer_.inserter(); }

    /// The inserter's setIndent.
    void setIndent(int nIndent) { inserter().setIndent(nIndent); }

private:
    FilteringOutputStreambuf<Inserter> oBuffer_;
};

} // namespace ORVO::Logging

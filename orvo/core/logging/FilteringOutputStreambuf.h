#pragma once

#include <streambuf>
#include <utility>

namespace ORVO::Logging {

/// A stream buffer that passes every character through an Inserter (`int operator()(std::streambuf&, int)`,
/// result the character or end-of-file) into a target stream buffer, which it does not own. It has no storage
/// of its own: nothing needs flushing.
///
/// Threads: one at a time.
template <typename Inserter>
class FilteringOutputStreambuf : public std::streambuf {
public:
    /// The target may be null: every character is then refused.
    explicit FilteringOutputStreambuf(std::streambuf* pTarget, Inserter inserter = Inserter())
        : pTarget_(pTarget), oInserter_(std::move(inserter)) {}

    Inserter& inserter() noexcept { return oInserter_; }
    std::streambuf* target() const noexcept { return pTarget_; }

protected:
    int_type overflow(int_type character) override {
        if (traits_type::eq_int_type(character, traits_type::eof()))
            return sync();
        if (pTarget_ == nullptr)
            return traits_type::eof();
        return oInserter_(*pTarget_, character);
    }
    int_type underflow() override { return traits_type::eof(); }
    int sync() override { return 0; }

private:
    std::streambuf* pTarget_;
    Inserter oInserter_;
};

} // namespace ORVO::Logging

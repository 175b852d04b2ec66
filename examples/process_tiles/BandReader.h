#pragma once

#include "common/Picture.h"

#include <array>
#include <condition_variable>
#include <cstddef>
#include <exception>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace example {

/// Rows of a picture: the first one, and the first one behind them.
struct Rows {
    int first;
    int end;
};

/// Rows of the picture in memory.
struct Band {
    int firstRow = 0;
    Picture picture;
};

/// Reads a picture file from the top in bands of whole rows, which may overlap, on a thread of its own: the
/// next band while the last one is worked on. Every row is read once. At most two bands are in memory.
class BandReader {
public:
    /// Opens the file. Throws PictureError.
    explicit BandReader(std::string path);
    BandReader(BandReader const&) = delete;
    BandReader& operator=(BandReader const&) = delete;
    ~BandReader();

    [[nodiscard]] int width() const;
    [[nodiscard]] int height() const;
    [[nodiscard]] std::size_t channels() const;
    /// The depth that holds every value of the file.
    [[nodiscard]] Depth depth() const;
    /// The ICC profile that stands in the file; empty where there is none.
    [[nodiscard]] std::vector<unsigned char> profile() const;
    /// How viewers turn the picture, as Picture has it.
    [[nodiscard]] int orientation() const;
    /// Bands end on multiples of so many rows, or at the end of the picture.
    [[nodiscard]] int rowUnit() const;
    /// How the file is compressed, as OpenImageIO names it; "none" where it does not say.
    [[nodiscard]] std::string compression() const;

    /// Begins to read bands, in a depth. The first one begins at row 0; each other one begins inside or just
    /// below the one before, and begins and ends no higher. To be called once.
    void start(std::vector<Rows> bands, Depth depth);

    /// The next band, which holds its rows and maybe more below. It stays until the next call. Throws
    /// PictureError.
    [[nodiscard]] Band const& next();

private:
    struct File;

    void readBands();
    void readBand(std::size_t index);
    void readRows(Band& band, int first, int end) const;
    [[nodiscard]] int fileEnd(Rows rows) const;
    /// Waits until a band's memory is free; false if nobody wants it any more.
    bool waitForMemory(std::size_t index);

    std::string path_;
    std::unique_ptr<File> file_;
    std::vector<Rows> bands_;
    Depth depth_ = Depth::uint8;
    std::array<Band, 2> memory_;

    std::mutex mutex_;
    std::condition_variable changed_;
    std::size_t read_ = 0;  ///< bands that stand, or stood, in memory
    std::size_t taken_ = 0; ///< bands that were asked for
    bool stopped_ = false;
    std::exception_ptr failure_;
    std::thread thread_;
};

} // namespace example

#include "process_tiles/BandReader.h"

#include "common/PictureIO.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace example {

namespace {

// Rows that are read at a time where the file leaves the choice.
constexpr int rowsAtATime = 64;

} // namespace

struct BandReader::File {
    std::unique_ptr<OIIO::ImageInput> input;
    OIIO::ImageSpec spec;

    [[nodiscard]] bool isTiled() const { return spec.tile_width > 0; }
    /// Rows are read in multiples of this, counted from the top: as they are stored, where that is not much
    /// at a time. Parts of strips of doubles come as zeros from OpenImageIO.
    [[nodiscard]] int rowUnit() const {
        if (isTiled())
            return spec.tile_height;
        int const strip = std::clamp(spec.get_int_attribute("tiff:RowsPerStrip", 1), 1, spec.height);
        return strip <= rowsAtATime || spec.format == OIIO::TypeDesc::DOUBLE ? strip : 1;
    }

    void read(int first, int end, OIIO::TypeDesc const& type, unsigned char* pixels) {
        // As the file has them, and converted here: OpenImageIO converts by way of a buffer that is larger
        // than any cache, and new for every call. That takes four times as long.
        if (!spec.channelformats.empty()) {
            readAs(type, first, end, pixels);
        } else if (spec.format == type) {
            readAs(OIIO::TypeDesc::UNKNOWN, first, end, pixels);
        } else {
            auto const values =
                static_cast<std::size_t>(spec.width) * static_cast<std::size_t>(spec.nchannels);
            auto const rows = static_cast<std::size_t>(end - first);
            asInFile.resize(rows * values * spec.format.size());
            readAs(OIIO::TypeDesc::UNKNOWN, first, end, asInFile.data());
            for (std::size_t row = 0; row < rows; ++row)
                OIIO::convert_pixel_values(spec.format, asInFile.data() + row * values * spec.format.size(),
                                           type, pixels + row * values * type.size(),
                                           static_cast<int>(values));
        }
    }

private:
    std::vector<unsigned char> asInFile;

    // UNKNOWN stands for the type of the file.
    void readAs(OIIO::TypeDesc const& type, int first, int end, void* pixels) {
        int const top = spec.y + first;
        int const bottom = spec.y + end;
        bool const done = isTiled()
                              ? input->read_tiles(0, 0, spec.x, spec.x + spec.width, top, bottom, 0, 1, 0,
                                                  spec.nchannels, type, pixels)
                              : input->read_scanlines(0, 0, top, bottom, 0, 0, spec.nchannels, type, pixels);
        if (!done)
            throw PictureError(firstLine(input->geterror()));
    }
};

BandReader::BandReader(std::string path) : path_(std::move(path)), file_(std::make_unique<File>()) {
    file_->input = openForReading(path_);
    file_->spec = file_->input->spec();
}

BandReader::~BandReader() {
    {
        std::lock_guard const lock(mutex_);
        stopped_ = true;
    }
    changed_.notify_all();
    if (thread_.joinable())
        thread_.join();
}

int BandReader::width() const { return file_->spec.width; }

int BandReader::height() const { return file_->spec.height; }

std::size_t BandReader::channels() const { return static_cast<std::size_t>(file_->spec.nchannels); }

Depth BandReader::depth() const { return depthOf(file_->spec.format); }

std::string BandReader::compression() const {
    return file_->spec.get_string_attribute("compression", "none");
}

std::vector<unsigned char> BandReader::profile() const { return profileOf(file_->spec); }

int BandReader::orientation() const { return orientationOf(file_->spec); }

int BandReader::rowUnit() const { return file_->rowUnit(); }

void BandReader::start(std::vector<Rows> bands, Depth depth) {
    bands_ = std::move(bands);
    depth_ = depth;
    // At once as much as any band takes: memory that grows is held twice for a moment.
    int rows = 0;
    for (Rows const& band : bands_)
        rows = std::max(rows, fileEnd(band) - band.first);
    for (Band& band : memory_)
        band.picture.pixels.reserve(static_cast<std::size_t>(rows) * static_cast<std::size_t>(width()) *
                                    channels() * bytesPerChannel(depth_));
    thread_ = std::thread([this] { readBands(); });
}

Band const& BandReader::next() {
    std::unique_lock lock(mutex_);
    std::size_t const index = taken_++;
    changed_.notify_all();
    changed_.wait(lock, [&] { return read_ > index || failure_; });
    if (read_ <= index)
        std::rethrow_exception(failure_);
    return memory_[index % 2];
}

bool BandReader::waitForMemory(std::size_t index) {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return stopped_ || taken_ + 1 > index; });
    return !stopped_;
}

void BandReader::readBands() {
    try {
        for (std::size_t index = 0; index < bands_.size() && waitForMemory(index); ++index) {
            readBand(index);
            std::lock_guard const lock(mutex_);
            ++read_;
            changed_.notify_all();
        }
    } catch (PictureError const& failure) {
        std::lock_guard const lock(mutex_);
        failure_ = std::make_exception_ptr(PictureError("Cannot read " + path_ + ": " + failure.what()));
        changed_.notify_all();
    } catch (...) {
        std::lock_guard const lock(mutex_);
        failure_ = std::current_exception();
        changed_.notify_all();
    }
}

int BandReader::fileEnd(Rows rows) const {
    int const unit = file_->rowUnit();
    return std::min((rows.end + unit - 1) / unit * unit, height());
}

void BandReader::readBand(std::size_t index) {
    Rows const rows = bands_[index];
    int const end = fileEnd(rows);
    Band& band = memory_[index % 2];
    band.firstRow = rows.first;
    band.picture.resize(static_cast<std::size_t>(width()), static_cast<std::size_t>(end - rows.first),
                        channels(), depth_);
    // What the band before holds is there already.
    int fresh = index == 0 ? 0 : fileEnd(bands_[index - 1]);
    if (index > 0 && fresh > rows.first) {
        Band const& before = memory_[(index - 1) % 2];
        std::size_t const rowBytes = band.picture.rowBytes();
        std::memcpy(band.picture.pixels.data(),
                    before.picture.pixels.data() +
                        static_cast<std::size_t>(rows.first - before.firstRow) * rowBytes,
                    static_cast<std::size_t>(std::min(fresh, end) - rows.first) * rowBytes);
    }
    for (int const unit = std::max(rowsAtATime / file_->rowUnit(), 1) * file_->rowUnit(); fresh < end;
         fresh += unit) {
        readRows(band, fresh, std::min(fresh + unit, end));
        std::lock_guard const lock(mutex_);
        if (stopped_)
            return;
    }
}

void BandReader::readRows(Band& band, int first, int end) const {
    auto const width = band.picture.width;
    auto const rows = static_cast<std::size_t>(end - first);
    auto* const target = band.picture.pixels.data() +
                         static_cast<std::size_t>(first - band.firstRow) * band.picture.rowBytes();
    bool const dividesByAlpha = hasAssociatedAlpha(file_->spec);
    // The scale of 16 bits is the engine's own, which OpenImageIO does not know.
    if (!dividesByAlpha && depth_ != Depth::uint15_1) {
        auto const type = depth_ == Depth::uint8 ? OIIO::TypeDesc::UINT8 : OIIO::TypeDesc::FLOAT;
        file_->read(first, end, type, target);
        return;
    }
    std::vector<float> values(width * rows * channels());
    file_->read(first, end, OIIO::TypeDesc::FLOAT, reinterpret_cast<unsigned char*>(values.data()));
    if (dividesByAlpha)
        changeAlpha(values, channels(), true);
    Picture part(width, rows, channels(), depth_);
    floatsToPicture(values, part);
    std::memcpy(target, part.pixels.data(), part.pixels.size());
}

} // namespace example

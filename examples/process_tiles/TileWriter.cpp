#include "process_tiles/TileWriter.h"

#include "common/PictureIO.h"

#include <filesystem>
#include <utility>

namespace example {

namespace {

bool isExr(std::string const& path) { return extensionOf(path) == ".exr"; }

bool isTiff(std::string const& path) {
    std::string const extension = extensionOf(path);
    return extension == ".tif" || extension == ".tiff";
}

bool hasAlpha(std::size_t channels) { return channels == 2 || channels == 4; }

// Of 16 bits the scale is the engine's own, which OpenImageIO does not know.
bool goesInFloats(std::string const& path, std::size_t fileChannels, Depth depth) {
    return depth == Depth::uint15_1 || (isExr(path) && hasAlpha(fileChannels));
}

OIIO::ImageSpec specOf(std::string const& path, TileFileFormat const& format) {
    OIIO::ImageSpec spec(format.width, format.height, static_cast<int>(format.channels),
                         fileType(extensionOf(path), format.depth));
    spec.tile_width = format.fileTile;
    spec.tile_height = format.fileTile;
    bool const alpha = hasAlpha(format.channels);
    spec.alpha_channel = alpha ? static_cast<int>(format.channels) - 1 : -1;
    spec["compression"] = format.compression;
    if (isExr(path)) {
        // Without this, tiles wait in memory for those that come before them in the file.
        spec["openexr:lineOrder"] = "randomY";
    } else {
        // One thread writes: at the level that is usual it takes five times as long, for files 3 % smaller.
        spec["tiff:zipquality"] = 4;
        setProfileAndOrientation(spec, format.profile, format.orientation);
        if (alpha)
            spec["oiio:UnassociatedAlpha"] = 1;
        if (spec.image_bytes(true) > 0xf0000000U)
            spec["tiff:bigtiff"] = 1;
    }
    return spec;
}

} // namespace

struct TileWriter::File {
    std::unique_ptr<OIIO::ImageOutput> output;
    TemporaryFile temporary;
    bool associatedAlpha;

    File(std::string const& path, TileFileFormat const& format)
        : output(outputFor(path)),
          temporary(path),
          associatedAlpha(isExr(path) && hasAlpha(format.channels)) {
        if (!output->open(temporary.path(), specOf(path, format)))
            throw PictureError("Cannot write " + path + ": " + firstLine(output->geterror()));
    }
    ~File() {
        // Closed before it is removed, and without a word: whoever fails has said so.
        if (output) {
            output->close();
            static_cast<void>(output->geterror());
        }
    }
    File(File const&) = delete;
    File& operator=(File const&) = delete;
};

void checkTilesWritable(std::string const& path) {
    if (!isExr(path) && !isTiff(path) && !std::filesystem::is_directory(path))
        throw PictureError("Cannot write " + path + ": tiles go into TIFF and EXR files");
    checkWritable(path);
}

std::size_t copiesToWrite(std::string const& path, std::size_t fileChannels, std::size_t channels,
                          Depth depth) {
    std::size_t bytes = 0;
    if (hasAlpha(channels) && !hasAlpha(fileChannels))
        bytes += (channels - 1) * bytesPerChannel(depth);
    if (fileChannels < 3)
        bytes += fileChannels * bytesPerChannel(depth);
    if (goesInFloats(path, fileChannels, depth))
        bytes += fileChannels * sizeof(float);
    return bytes;
}

TileWriter::TileWriter(std::string const& path, TileFileFormat const& format)
    : path_(path),
      format_(format),
      file_(std::make_unique<File>(path, format)),
      thread_([this] { writeJobs(); }) {}

TileWriter::~TileWriter() {
    {
        std::lock_guard const lock(mutex_);
        abandoned_ = true;
    }
    stop();
}

void TileWriter::stop() {
    {
        std::lock_guard const lock(mutex_);
        complete_ = true;
    }
    changed_.notify_all();
    if (thread_.joinable())
        thread_.join();
}

Picture TileWriter::spare() {
    std::lock_guard const lock(mutex_);
    if (spares_.empty())
        return {};
    Picture picture = std::move(spares_.back());
    spares_.pop_back();
    return picture;
}

void TileWriter::write(Rectangle const& tile, Rectangle const& computed, Picture picture) {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [this] { return jobs_.empty() || failure_; });
    if (failure_)
        std::rethrow_exception(failure_);
    jobs_.push_back({tile, computed, std::move(picture)});
    changed_.notify_all();
}

void TileWriter::writeJobs() {
    for (;;) {
        std::unique_lock lock(mutex_);
        changed_.wait(lock, [this] { return !jobs_.empty() || complete_; });
        if (jobs_.empty() || abandoned_ || failure_)
            return;
        Job job = std::move(jobs_.front());
        jobs_.pop_front();
        changed_.notify_all();
        lock.unlock();
        try {
            writeJob(job);
        } catch (...) {
            lock.lock();
            failure_ = std::current_exception();
            changed_.notify_all();
            return;
        }
        lock.lock();
        spares_.push_back(std::move(job.picture));
    }
}

void TileWriter::writeJob(Job& job) {
    bool const grey = format_.channels < 3;
    Picture const* picture = &job.picture;
    Picture changed;
    if (picture->hasAlpha() && !hasAlpha(format_.channels))
        picture = &(changed = withoutAlpha(*picture));
    if (grey)
        picture = &(changed = reducedToGrey(*picture));
    std::vector<float> floats;
    OIIO::TypeDesc type = picture->depth == Depth::uint8 ? OIIO::TypeDesc::UINT8 : OIIO::TypeDesc::FLOAT;
    void const* pixels = picture->pixels.data();
    if (goesInFloats(path_, format_.channels, picture->depth)) {
        floats = pictureToFloats(*picture);
        if (file_->associatedAlpha)
            changeAlpha(floats, picture->channels, false);
        type = OIIO::TypeDesc::FLOAT;
        pixels = floats.data();
    }
    auto const pixelBytes = static_cast<OIIO::stride_t>(picture->channels * type.size());
    auto const rowBytes = static_cast<OIIO::stride_t>(picture->width) * pixelBytes;
    auto const* const first = static_cast<unsigned char const*>(pixels) +
                              (job.tile.position().y() - job.computed.position().y()) * rowBytes +
                              (job.tile.position().x() - job.computed.position().x()) * pixelBytes;
    if (!file_->output->write_tiles(job.tile.position().x(), rightOf(job.tile), job.tile.position().y(),
                                    bottomOf(job.tile), 0, 1, type, first, pixelBytes, rowBytes))
        throw PictureError("Cannot write " + path_ + ": " + firstLine(file_->output->geterror()));
}

void TileWriter::finish() {
    stop();
    if (failure_)
        std::rethrow_exception(failure_);
    if (!file_->output->close())
        throw PictureError("Cannot write " + path_ + ": " + firstLine(file_->output->geterror()));
    file_->temporary.takePlace();
}

} // namespace example

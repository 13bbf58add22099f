// PhotoFile.h: photos between the files of this machine and the contacts store.
#pragma once

#include <string>

// A copy of a photo below the root, where the store can take it; it goes with the object.
class StagedPhoto {
public:
    // A Failure when the file cannot be read, is empty or larger than a photo may be. An empty path stages nothing.
    explicit StagedPhoto(const std::string& source);
    // Of the image itself.
    struct Bytes {
        const std::string& bytes;
    };
    explicit StagedPhoto(const Bytes& image) { stage(image.bytes); }
    ~StagedPhoto();
    StagedPhoto(const StagedPhoto&) = delete;
    StagedPhoto& operator=(const StagedPhoto&) = delete;

    // Below the root; empty when nothing was staged.
    [[nodiscard]] const std::string& path() const { return mPath; }

private:
    void stage(const std::string& bytes);

    std::string mPath;
};

namespace photo_file {

inline constexpr size_t kMostBytes = size_t{32} * 1024 * 1024;  // what the store takes

// The image at `source`, a path of this machine.
std::string read(const std::string& source);
// Copies the photo at `source` (a path of this machine) to a file, "-" for standard output.
void save(const std::string& source, const std::string& target);

}  // namespace photo_file

// CtStagedPhoto: the file that a downloaded photo lies in until the record store has taken it; it goes with the object.
// Owner: the item of a page.   Threads: one at a time; two workers never share a file.
#pragma once

#include <cstdio>
#include <memory>
#include <string>

class CtStagedPhoto {
public:
    // A new file of mode 0600 for the photo, never through a link. NULL (logged) when the id names no file or it cannot be made.
    static std::unique_ptr<CtStagedPhoto> create(const std::string& id);
    ~CtStagedPhoto();
    CtStagedPhoto(const CtStagedPhoto&) = delete;
    CtStagedPhoto& operator=(const CtStagedPhoto&) = delete;

    // Below the root.
    [[nodiscard]] const std::string& path() const { return mPath; }
    // NULL once it is finished.
    [[nodiscard]] FILE* file() const { return mpFile; }
    // Closes the file; whether all of it was written and it looks like an image.
    [[nodiscard]] bool finish(const std::string& contentType);

private:
    CtStagedPhoto(std::string path, FILE* file) : mPath(std::move(path)), mpFile(file) {}

    const std::string mPath;
    FILE* mpFile;
};

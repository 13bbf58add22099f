// PageFiles: the files of the folder page/, which the build puts into the program so that it stays one file.
#pragma once

#include <span>
#include <string_view>

namespace provider {

struct PageFile {
    std::string_view name;
    std::string_view content;
};
extern const std::span<const PageFile> kPageFiles;

}  // namespace provider

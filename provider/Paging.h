// Paging: page tokens name the place where a list goes on, and belong to one list.
#pragma once

#include <cstddef>
#include <string>

namespace provider {

std::string pageToken(const std::string& list, std::size_t next);
// Empty text is the beginning. Throws ApiError 400 for a token that was not made for this list.
std::size_t readPageToken(const std::string& list, const std::string& token);

}  // namespace provider

// Bodies that no reader may take, texts that every reader must keep, and how much memory it took.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace hostile {

struct Body {
    std::string name;
    std::string text;
};

inline std::string contentOf(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

// The files of the JSON suite; the first letter of a name says whether it is valid ("y"), not ("n"), or free ("i").
inline std::vector<Body> jsonSuite() {
    std::vector<Body> bodies;
    for (const auto& entry : std::filesystem::directory_iterator(VPS_CORPUS_DIR "/json-suite/test_parsing"))
        bodies.push_back({entry.path().filename(), contentOf(entry.path())});
    EXPECT_EQ(bodies.size(), 318U);
    return bodies;
}

inline std::vector<std::string> naughtyStrings() {
    std::vector<std::string> texts =
        nlohmann::json::parse(contentOf(VPS_CORPUS_DIR "/strings/naughty-strings.json"));
    EXPECT_EQ(texts.size(), 515U);
    return texts;
}

inline std::string repeated(std::string_view text, size_t count) {
    std::string all;
    all.reserve(text.size() * count);
    for (size_t i = 0; i < count; ++i) all += text;
    return all;
}

// `list`: a reply that the reader takes. None of these may be taken for it.
inline std::vector<Body> badBodies(const std::string& list) {
    constexpr size_t kDepth = 100'000;
    return {{"a NUL and junk behind it", list + std::string("\0junk", 5)},
            {"another document behind it", list + list},
            {"a byte order mark before it", "\xEF\xBB\xBF" + list},
            {"cut by one byte", list.substr(0, list.size() - 1)},
            {"a comment behind it", list + "/* */"},
            {"arrays 100,000 deep", repeated("[", kDepth) + repeated("]", kDepth)},
            {"objects 100,000 deep", repeated(R"({"items":)", kDepth) + "1" + repeated("}", kDepth)},
            {"arrays 100,000 deep that never end", repeated("[", kDepth)},
            {"not UTF-8", "{\"\xFF\":" + list + "}"},
            {"UTF-16", std::string("{\0}\0", 4)}};
}

// The most that the process has held since its start; 0 under a sanitizer, which keeps what was freed.
inline size_t peakMegabytes() {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    return 0;
#else
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) {
        if (line.starts_with("VmHWM:"))
            return std::stoul(line.substr(line.find_first_of("0123456789"))) / 1024;
    }
    ADD_FAILURE() << "no peak in /proc/self/status";
    return 0;
#endif
}

}  // namespace hostile

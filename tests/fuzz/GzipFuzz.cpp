// The inflating of a reply.
#include <zlib.h>

#include "calendar/CalCurl.h"
#include "common/SyncResult.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using sync_result::kOk;

namespace {

constexpr size_t kMaxBytes = 1 << 20;

std::string deflated(const std::string& text) {
    constexpr int kGzipWindow = 31;
    constexpr int kMemoryLevel = 8;
    z_stream stream{};
    require(deflateInit2(&stream, Z_BEST_SPEED, Z_DEFLATED, kGzipWindow, kMemoryLevel, Z_DEFAULT_STRATEGY) ==
                Z_OK,
            "zlib has memory");
    std::string input = text;
    std::string out(deflateBound(&stream, text.size()), '\0');
    stream.next_in = reinterpret_cast<Bytef*>(input.data());
    stream.avail_in = static_cast<uInt>(input.size());
    stream.next_out = reinterpret_cast<Bytef*>(out.data());
    stream.avail_out = static_cast<uInt>(out.size());
    require(deflate(&stream, Z_FINISH) == Z_STREAM_END, "zlib deflates");
    out.resize(stream.total_out);
    deflateEnd(&stream);
    return out;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string body = fuzz::textOf(data, size);
    std::string text = "before";
    if (inflateGzip(body, &text, kMaxBytes) != kOk) {
        require(text == "before", "a refusal changes nothing");
        return 0;
    }
    require(text.size() <= std::max(kMaxBytes, size), "a reply keeps to its limit");
    require(text.capacity() <= 2 * (kMaxBytes + size), "so does the room for it");
    // A body that is not compressed passes as it is; zero bytes in it are the next reader's to refuse.
    if (text.find('\0') != std::string::npos) return 0;
    std::string again;
    require(inflateGzip(deflated(text), &again, kMaxBytes + size) == kOk && again == text,
            "what was inflated is deflated and inflated to the same");
    return 0;
}

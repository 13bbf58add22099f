#include "Gzip.h"

#include <zlib.h>

#include <memory>
#include <stdexcept>

namespace provider {

std::string gzip(const std::string& text) {
    constexpr int kGzipWindow = 15 + 16;
    constexpr int kMemoryLevel = 8;
    z_stream stream{};
    if (deflateInit2(&stream, Z_BEST_SPEED, Z_DEFLATED, kGzipWindow, kMemoryLevel, Z_DEFAULT_STRATEGY) !=
        Z_OK) {
        throw std::runtime_error("gzip: no memory");
    }
    const std::unique_ptr<z_stream, int (*)(z_stream*)> end(&stream, deflateEnd);
    std::string out(deflateBound(&stream, text.size()), '\0');
    // zlib's interface is older than const.
    stream.next_in = const_cast<Bytef*>(reinterpret_cast<const Bytef*>(text.data()));
    stream.avail_in = static_cast<uInt>(text.size());
    stream.next_out = reinterpret_cast<Bytef*>(out.data());
    stream.avail_out = static_cast<uInt>(out.size());
    if (deflate(&stream, Z_FINISH) != Z_STREAM_END) throw std::runtime_error("gzip: failed");
    out.resize(stream.total_out);
    return out;
}

}  // namespace provider

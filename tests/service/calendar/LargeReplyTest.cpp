// Replies that are too large, as they come from the wire: an error, and memory under a cap.
#include <gtest/gtest.h>
#include <zlib.h>

#include "calendar/CalCurl.h"
#include "common/Account.h"
#include "common/SyncResult.h"
#include "support/Hostile.h"
#include "support/TestRoot.h"

#include <httplib.h>

#include <thread>

using sync_result::kFailed;
using sync_result::kOk;

namespace {

// With its charset on purpose: the server library compresses "application/json" on its own account.
constexpr const char* kType = "application/json; charset=UTF-8";

// `megabytes` of blanks, deflated a megabyte at a time.
std::string bomb(size_t megabytes) {
    z_stream stream{};
    EXPECT_EQ(deflateInit2(&stream, Z_BEST_COMPRESSION, Z_DEFLATED, 31, 8, Z_DEFAULT_STRATEGY), Z_OK);
    std::string blanks(1U << 20, ' ');
    std::string out;
    std::string chunk(1U << 20, '\0');
    for (size_t i = 0; i <= megabytes; ++i) {
        stream.next_in = reinterpret_cast<Bytef*>(blanks.data());
        stream.avail_in = static_cast<uInt>(i < megabytes ? blanks.size() : 0);
        stream.next_out = reinterpret_cast<Bytef*>(chunk.data());
        stream.avail_out = static_cast<uInt>(chunk.size());
        EXPECT_EQ(deflate(&stream, i < megabytes ? Z_NO_FLUSH : Z_FINISH),
                  i < megabytes ? Z_OK : Z_STREAM_END);
        out.append(chunk, 0, chunk.size() - stream.avail_out);
    }
    deflateEnd(&stream);
    return out;
}

// Sends what the test says without holding it.
class LargeServer {
public:
    LargeServer() {
        mServer.Get("/page", [](const httplib::Request&, httplib::Response& response) {
            constexpr size_t kPageBytes = 200UL << 20;
            response.set_content_provider(kPageBytes, kType,
                                          [](size_t offset, size_t left, httplib::DataSink& sink) {
                                              static const std::string blanks(1U << 16, ' ');
                                              constexpr std::string_view kList = R"({"items":[]})";
                                              if (offset == 0) return sink.write(kList.data(), kList.size());
                                              return sink.write(blanks.data(), std::min(blanks.size(), left));
                                          });
        });
        mServer.Get("/bomb", [](const httplib::Request&, httplib::Response& response) {
            static const std::string body = bomb(1024);
            response.set_content(body, kType);
        });
        mServer.Get("/small", [](const httplib::Request&, httplib::Response& response) {
            response.set_content(bomb(1), kType);
        });
        mPort = mServer.bind_to_any_port("127.0.0.1");
        mThread = std::thread([this] { mServer.listen_after_bind(); });
        while (!mServer.is_running()) std::this_thread::yield();
    }
    ~LargeServer() {
        mServer.stop();
        mThread.join();
    }
    [[nodiscard]] std::string url() const { return "http://127.0.0.1:" + std::to_string(mPort); }

private:
    httplib::Server mServer;
    int mPort = 0;
    std::thread mThread;
};

}  // namespace

TEST(LargeReply, IsAnErrorAndLittleMemory) {
    // Of an answer 64 MiB are held at most, and for a moment more while their string grows.
    constexpr size_t kMostMegabytes = 256;
    for (const char* path : {"/page", "/bomb"}) {
        const TestRoot root;
        LargeServer server;
        std::string url = server.url();
        vantor_pim_sync_account_s fields{};
        fields.account_id = 1;
        fields.calserver = url.data();
        Account account(fields);
        CalCurl curl(&account, nullptr);
        std::string reply;
        ASSERT_EQ(curl.get("/small", &reply), kOk);
        EXPECT_EQ(reply.size(), 1U << 20);
        EXPECT_EQ(curl.get(path, &reply), kFailed) << path;
        EXPECT_LE(hostile::peakMegabytes(), kMostMegabytes) << path;
    }
}

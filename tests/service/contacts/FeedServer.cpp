#include "service/contacts/FeedServer.h"

namespace {

constexpr size_t kPage = 2;
constexpr const char* kHost = "/m8/feeds/";

Json fieldsOf(const Json& atom) {
    Json fields = atom;
    for (const char* member : {"xmlns:atom", "xmlns:gd", "xmlns:gContact", "xmlns$atom", "xmlns$gd",
                               "xmlns$gContact", "gd$etag", "category", "id", "$t"}) {
        fields.erase(member);
    }
    return fields;
}

std::string encoded(const std::string& id) {
    std::string text;
    for (const unsigned char c : id) {
        char code[8];
        std::snprintf(code, sizeof code, std::isalnum(c) != 0 ? "%c" : "%%%02X", c);
        text += code;
    }
    return text;
}

}  // namespace

FeedServer::FeedServer() {
    mServer.set_keep_alive_max_count(100000);
    serveFeeds("contacts");
    serveFeeds("groups");
    servePhotos();
    servePeople();
    mPort = mServer.bind_to_any_port("127.0.0.1");
    mThread = std::thread([this] { mServer.listen_after_bind(); });
    while (!mServer.is_running()) std::this_thread::yield();
}

FeedServer::~FeedServer() {
    mServer.stop();
    mThread.join();
}

void FeedServer::put(const std::string& feed, const std::string& id, const Json& fields) {
    const std::lock_guard lock(mMutex);
    mEntries[feed][id] = fields;
    mEntries[feed][id]["gd$etag"] = nextEtag();
}

void FeedServer::erase(const std::string& feed, const std::string& id) {
    const std::lock_guard lock(mMutex);
    mEntries[feed].erase(id);
}

void FeedServer::putPhoto(const std::string& id, const std::string& bytes) {
    const std::lock_guard lock(mMutex);
    mPhotos[id] = {nextEtag(), bytes};
    mEntries["contacts"][id]["gd$etag"] = nextEtag();
}

void FeedServer::erasePhoto(const std::string& id) {
    const std::lock_guard lock(mMutex);
    mPhotos.erase(id);
    mEntries["contacts"][id]["gd$etag"] = nextEtag();
}

std::map<std::string, Json> FeedServer::all(const std::string& feed) {
    const std::lock_guard lock(mMutex);
    std::map<std::string, Json> entries = mEntries[feed];
    for (auto& [id, fields] : entries) fields.erase("gd$etag");
    return entries;
}

std::string FeedServer::photo(const std::string& id) {
    const std::lock_guard lock(mMutex);
    return mPhotos.contains(id) ? mPhotos[id].second : "";
}

int FeedServer::takeWrites() {
    const std::lock_guard lock(mMutex);
    return std::exchange(mWrites, 0);
}

Json FeedServer::entry(const std::string& feed, const std::string& id) const {
    const std::string base = url() + kHost + feed + "/a%40x.com/";
    Json shown = mEntries.at(feed).at(id);
    shown["id"] = {{"$t", base + "base/" + encoded(id)}};
    shown["updated"] = {{"$t", "2026-03-01T10:00:00.000Z"}};
    shown["link"] = {{{"rel", "edit"}, {"href", base + "full/" + encoded(id)}}};
    if (mPhotos.contains(id) && feed == "contacts") {
        shown["link"].push_back({{"rel", "http://any/rel#photo"},
                                 {"href", url() + kHost + "photos/media/a%40x.com/" + encoded(id)},
                                 {"gd$etag", mPhotos.at(id).first}});
    }
    return shown;
}

void FeedServer::writeDone(httplib::Response& response, const Json& body, int status) {
    ++mWrites;
    response.status = failNextWrites-- > 0 ? 500 : status;
    if (failNextWrites < 0) failNextWrites = 0;
    if (!body.is_null()) response.set_content(Json{{"entry", body}}.dump(), "application/json");
}

void FeedServer::serveFeeds(const std::string& feed) {
    const std::string list = std::string(kHost) + feed + "/default/full";
    mServer.Get(list, [this, feed](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        const size_t start = request.has_param("start") ? std::stoul(request.get_param_value("start")) : 0;
        const size_t page = request.has_param("max-results") ? 1000000 : kPage;
        if (start > 0 && endsEarly && feed == "contacts") {
            response.status = 503;
            return;
        }
        if (feed == "contacts" && !listText.empty()) {
            response.status = listStatus;
            response.set_content(listText, "application/json");
            return;
        }
        const bool isEmpty = feed == "contacts" && start == 0 && emptyLists > 0;
        if (isEmpty) --emptyLists;
        if (const auto hook = onGroupsRead; hook && feed == "groups") hook();
        if (feed == "groups" && start == 0) mHidesGroup = hiddenLists-- > 0;
        Json shown = {{"entry", Json::array()}, {"link", Json::array()}};
        size_t at = 0;
        for (const auto& [id, fields] : mEntries[feed]) {
            if (feed == "groups" && mHidesGroup && id == hiddenGroup) continue;
            if (at >= start && at < start + page && !isEmpty) shown["entry"].push_back(entry(feed, id));
            ++at;
        }
        if (at > start + page && !isEmpty) {
            shown["link"].push_back({{"rel", "next"},
                                     {"href", url() + kHost + feed + "/default/full?alt=json&start=" +
                                                  std::to_string(start + page)}});
        }
        response.set_content(Json{{"feed", shown}}.dump(), "application/json");
    });
    mServer.Post(list, [this, feed](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        if (feed == "groups" && groupWriteStatus != 0) {
            response.status = groupWriteStatus;
            return;
        }
        const std::string id = "n" + std::to_string(++mRevision);
        mEntries[feed][id] = fieldsOf(readAtom(request.body));
        mEntries[feed][id]["gd$etag"] = nextEtag();
        writeDone(response, entry(feed, id), 201);
    });
    const std::string one = list + "/(.+)";
    mServer.Get(one, [this, feed](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        const std::string id = request.matches[1];
        if (!mEntries[feed].contains(id)) {
            response.status = 404;
        } else {
            response.set_content(Json{{"entry", entry(feed, id)}}.dump(), "application/json");
        }
    });
    const auto change = [this, feed](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        const std::string id = request.matches[1];
        const auto found = mEntries[feed].find(id);
        if (found == mEntries[feed].end()) {
            response.status = 404;
        } else if (found->second["gd$etag"] != request.get_header_value("If-Match")) {
            response.status = 409;
        } else if (request.method == "DELETE") {
            mEntries[feed].erase(id);
            writeDone(response, nullptr, 200);
        } else {
            found->second = fieldsOf(readAtom(request.body));
            found->second["gd$etag"] = nextEtag();
            writeDone(response, entry(feed, id), 200);
        }
    };
    mServer.Put(one, change);
    mServer.Delete(one, change);
}

void FeedServer::servePeople() {
    mServer.Get("/orbit/v1/people/p1", [this](const httplib::Request& request, httplib::Response& response) {
        const bool isOpen = request.has_param("key") && !request.has_header("Authorization");
        const std::lock_guard lock(mMutex);
        response.status = isOpen ? profileStatus : 400;
        const Json profile = {{"givenName", "Public"},
                              {"birthday", "1985-03-07"},
                              {"image", {{"url", url() + "/img/p1?sz=50"}}}};
        response.set_content(profile.dump(), "application/json");
    });
    mServer.Get("/img/p1", [this](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        response.status = profileImageStatus;
        response.set_content("profile image " + request.get_param_value("sz"), "image/jpeg");
    });
}

void FeedServer::servePhotos() {
    const std::string one = std::string(kHost) + "photos/media/[^/]+/(.+)";
    mServer.Get(one, [this](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        if (const auto hook = onPhotoRead) hook();
        response.status = photoStatus;
        if (photoStatus == 200) response.set_content(mPhotos[request.matches[1]].second, "image/jpeg");
    });
    const auto change = [this](const httplib::Request& request, httplib::Response& response) {
        const std::lock_guard lock(mMutex);
        const std::string id = request.matches[1];
        const std::string match = request.get_header_value("If-Match");
        if (photoWriteStatus != 0) {
            response.status = photoWriteStatus;
            return;
        }
        if (mPhotos.contains(id) && mPhotos[id].first != match) {
            response.status = 409;
            return;
        }
        if (request.method == "DELETE") {
            mPhotos.erase(id);
        } else {
            mPhotos[id] = {nextEtag(), request.body};
        }
        mEntries["contacts"][id]["gd$etag"] = nextEtag();
        if (const auto hook = onPhotoWritten) hook(mEntries["contacts"]);
        writeDone(response, nullptr, 200);
    };
    mServer.Put(one, change);
    mServer.Delete(one, change);
}

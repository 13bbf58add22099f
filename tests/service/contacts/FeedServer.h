// FeedServer: a contacts service in a test: entries by id, pages of two, etags that are checked. In hrefs ids are
// percent-encoded. Not strict about content.
#pragma once

#include <httplib.h>

#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "service/contacts/AtomReader.h"

class FeedServer {
public:
    FeedServer();
    ~FeedServer();
    [[nodiscard]] std::string url() const { return "http://127.0.0.1:" + std::to_string(mPort); }

    // Feeds are "contacts" and "groups".
    void put(const std::string& feed, const std::string& id, const Json& fields);
    void erase(const std::string& feed, const std::string& id);
    void putPhoto(const std::string& id, const std::string& bytes);
    void erasePhoto(const std::string& id);
    [[nodiscard]] std::map<std::string, Json> all(const std::string& feed);
    [[nodiscard]] std::string photo(const std::string& id);
    // Requests that wrote since the last call.
    [[nodiscard]] int takeWrites();

    // Faults, read under the lock.
    int failNextWrites = 0;   // answered with 500 although they were carried out
    int emptyLists = 0;       // so many requests for the first page of the contacts list nothing
    std::string hiddenGroup;  // left out of so many lists:
    int hiddenLists = 0;
    bool endsEarly = false;  // the second page is an error
    int listStatus = 200;
    std::string listText;  // in place of the contacts, when it is not empty
    int photoStatus = 200;
    int groupWriteStatus = 0;  // refuses with this, nothing is carried out
    int photoWriteStatus = 0;  // likewise
    // Runs once a photo is written, with the contacts at hand; their etags stay as they are afterwards.
    std::function<void(std::map<std::string, Json>& contacts)> onPhotoWritten;
    // Before they are answered.
    std::function<void()> onPhotoRead;
    std::function<void()> onGroupsRead;
    int profileStatus = 200;
    int profileImageStatus = 200;

private:
    void serveFeeds(const std::string& feed);
    void servePhotos();
    void servePeople();  // "p1", with an image
    Json entry(const std::string& feed, const std::string& id) const;
    void writeDone(httplib::Response& response, const Json& body, int status);
    std::string nextEtag() { return "\"" + std::to_string(++mRevision) + "\""; }

    std::mutex mMutex;
    std::map<std::string, std::map<std::string, Json>> mEntries;
    std::map<std::string, std::pair<std::string, std::string>> mPhotos;  // etag and bytes
    int mRevision = 0;
    int mWrites = 0;
    bool mHidesGroup = false;  // in the list that is being read
    httplib::Server mServer;
    int mPort = 0;
    std::thread mThread;
};

#include "ProviderFixture.h"

namespace provider {
namespace {

class Instance : public ProviderFixture {
protected:
    Instance() {
        mSeries =
            insert({{"summary", "weekly"}, {"recurrence", Json::array({"RRULE:FREQ=WEEKLY"})}}).at("id");
        Json allDay =
            Json::parse(R"({"summary":"daily","start":{"date":"2026-03-02"},"end":{"date":"2026-03-04"},
                                      "recurrence":["RRULE:FREQ=DAILY"]})");
        mDaily = insert(allDay).at("id");
    }

    std::vector<std::string> listed() {
        std::vector<std::string> ids;
        const Json items = get(std::string(kEvents) + "?fields=items(id,status)").body.at("items");
        for (const Json& item : items)
            ids.push_back(item.at("id").get<std::string>() + " " + item.at("status").get<std::string>());
        return ids;
    }

    std::string mSeries;
    std::string mDaily;
};

TEST_F(Instance, IsThereBeforeAnybodyChangedIt) {
    const Json timed = get(event(mSeries + "_20260309T090000Z")).body;
    EXPECT_EQ(timed.at("start").dump(),
              R"({"dateTime":"2026-03-09T10:00:00+01:00","timeZone":"Europe/Berlin"})");
    EXPECT_EQ(timed.at("end").at("dateTime"), "2026-03-09T11:00:00+01:00");
    EXPECT_EQ(timed.at("originalStartTime"), timed.at("start"));
    EXPECT_EQ(timed.at("recurringEventId"), mSeries);
    EXPECT_EQ(timed.count("recurrence"), 0U);
    const Json daily = get(event(mDaily + "_20260305")).body;
    EXPECT_EQ(daily.at("end").dump(), R"({"date":"2026-03-07"})");
    EXPECT_EQ(listed().size(), 2U);
    for (const char* bad : {"_20260305", "_20260223T090000Z", "_20260309T090000", "_x", "_"}) {
        EXPECT_EQ(get(event(mSeries + bad)).status, 404) << bad;
    }
    EXPECT_EQ(get(event(mDaily + "_20260305T000000Z")).status, 404);
}

TEST_F(Instance, BecomesAnItemOfItsOwnWhenChanged) {
    const std::string id = mSeries + "_20260309T090000Z";
    const Answer patched =
        send("PATCH", event(id), R"({"summary":"moved","start":{"dateTime":"2026-03-10T08:00:00Z"},
                                                        "end":{"dateTime":"2026-03-10T09:00:00Z"}})");
    ASSERT_EQ(patched.status, 200) << patched.text;
    EXPECT_EQ(patched.body.at("originalStartTime").at("dateTime"), "2026-03-09T10:00:00+01:00");
    EXPECT_EQ(get(event(id)).body, patched.body);
    EXPECT_EQ(listed().back(), id + " confirmed");
    // Once more: what was changed before stays.
    EXPECT_EQ(send("PATCH", event(id), R"({"location":"x"})").body.at("summary"), "moved");
    EXPECT_EQ(send("PATCH", event(id), R"({"recurrence":["RRULE:FREQ=DAILY"]})").status, 400);
}

TEST_F(Instance, CancelledIsListedAsAMinimalItem) {
    const std::string changed = mSeries + "_20260309T090000Z";
    send("PATCH", event(changed), R"({"summary":"changed first"})");
    for (const std::string& id : {changed, mDaily + "_20260305"}) {
        EXPECT_EQ(send("DELETE", event(id)).status, 204) << id;
        const Json item = get(event(id)).body;
        EXPECT_EQ(item.at("status"), "cancelled");
        EXPECT_EQ(item.size(), 6U) << item.dump();
        EXPECT_EQ(send("DELETE", event(id)).status, 410) << id;
    }
    EXPECT_EQ(listed().size(), 4U);
    const Answer patched = send("PATCH", event(mDaily + "_20260306"), R"({"status":"cancelled"})");
    EXPECT_EQ(patched.body.count("summary"), 0U);
}

TEST_F(Instance, ComesBackFromCancelled) {
    const std::string id = mSeries + "_20260309T090000Z";
    send("DELETE", event(id));
    EXPECT_EQ(send("PATCH", event(id), R"({"summary":"still off"})").body.at("status"), "cancelled");
    const Answer back = send("PATCH", event(id), R"({"status":"confirmed","summary":"on"})");
    EXPECT_EQ(back.body.at("summary"), "on");
    EXPECT_EQ(back.body.at("start").at("dateTime"), "2026-03-09T10:00:00+01:00");
    EXPECT_EQ(listed().size(), 3U);
}

TEST_F(Instance, APostThatNamesItIsItsPatch) {
    Json body =
        Json::parse(R"({"summary":"by post","originalStartTime":{"dateTime":"2026-03-09T09:00:00Z"}})");
    EXPECT_EQ(send("POST", kEvents, body.dump()).status, 400);
    body["recurringEventId"] = mSeries;
    const Answer posted = send("POST", kEvents, body.dump());
    EXPECT_EQ(posted.body.value("id", ""), mSeries + "_20260309T090000Z") << posted.text;
    EXPECT_EQ(get(event(posted.body)).body.at("summary"), "by post");
    body["recurringEventId"] = "never0";
    EXPECT_EQ(send("POST", kEvents, body.dump()).status, 404);
}

TEST_F(Instance, GoesWithItsSeriesAndOnlyThen) {
    send("PATCH", event(mSeries + "_20260309T090000Z"), R"({"summary":"x"})");
    send("DELETE", event(mSeries + "_20260316T090000Z"));
    EXPECT_EQ(send("PATCH", event(mSeries), R"({"summary":"series"})").status, 200);
    EXPECT_EQ(listed().size(), 4U);
    EXPECT_EQ(get(event(mSeries + "_20260309T090000Z")).body.at("summary"), "x");
    EXPECT_EQ(get(event(mSeries + "_20260323T090000Z")).body.at("summary"), "series");
    EXPECT_EQ(send("DELETE", event(mSeries)).status, 204);
    EXPECT_EQ(listed(), std::vector<std::string>{mDaily + " confirmed"});
    EXPECT_EQ(get(event(mSeries + "_20260309T090000Z")).status, 410);
    EXPECT_EQ(get(event(mSeries + "_20260323T090000Z")).status, 404);
}

}  // namespace
}  // namespace provider

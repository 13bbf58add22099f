#include "Services.h"

namespace provider {

namespace {

// More than a person would read.
constexpr std::size_t kMaxNews = 200;

std::string emailOf(const Json& body) {
    const auto email = body.find("email");
    if (email == body.end() || !email->is_string()) {
        throw ApiError{400, "required", "Required: email", "email"};
    }
    return email->get<std::string>();
}

}  // namespace

void AdminControlService::addRoutes(Router& router) {
    const auto add = [&](const char* method, const char* pattern, std::function<Reply(const Call&)> serve) {
        router.add(method, pattern, Access::kAdmin, std::move(serve));
    };
    add("GET", "/admin/requests", [this](const Call&) { return jsonReply(mContext.log.json()); });
    add("DELETE", "/admin/requests", [this](const Call&) {
        mContext.log.clear();
        return done();
    });
    add("GET", "/admin/news", [this](const Call& call) {
        Json body = {{"run", mContext.run}, {"changes", mContext.changes.load()}};
        body.update(mContext.log.since(static_cast<std::uint64_t>(call.number("since", 0, 0)), kMaxNews));
        return jsonReply(body);
    });
    add("POST", "/admin/tokens/expire", [this](const Call&) {
        mContext.tokens.expire();
        return done();
    });
    add("POST", "/admin/tokens/revoke", [this](const Call& call) {
        const std::string email = emailOf(jsonBody(call));
        const auto lock = mContext.store.guard();
        mContext.store.account(email).refreshToken.clear();
        mContext.tokens.expire(email);
        return done();
    });
    add("POST", "/admin/tokens/issue", [this](const Call& call) {
        const std::string email = emailOf(jsonBody(call));
        const auto lock = mContext.store.guard();
        Account& account = mContext.store.account(email);
        mContext.store.issueRefreshToken(account);
        return jsonReply({{"email", email}, {"refreshToken", account.refreshToken}});
    });
    add("GET", "/admin/faults", [this](const Call&) {
        Json body;
        body["faults"] = mContext.faults.list();
        return jsonReply(body);
    });
    add("POST", "/admin/faults", [this](const Call& call) {
        mContext.faults.add(Fault::parse(jsonBody(call)));
        return done();
    });
    add("DELETE", "/admin/faults", [this](const Call&) {
        mContext.faults.clear();
        return done();
    });
    add("GET", "/admin/hold", [this](const Call& call) { return held(call); });
    add("POST", "/admin/hold", [this](const Call& call) {
        mContext.faults.hold(Match::parse(jsonBody(call)));
        return done();
    });
    add("POST", "/admin/release", [this](const Call&) {
        mContext.faults.release();
        return done();
    });
}

Reply AdminControlService::held(const Call& call) {
    const auto atLeast = static_cast<std::size_t>(call.number("atLeast", 0, 0));
    const std::chrono::milliseconds limit(std::min(call.number("timeoutMs", 5000, 0), 60000LL));
    const bool reached = mContext.faults.waitForHeld(atLeast, limit);
    return jsonReply(mContext.faults.holds(), reached ? 200 : 408);
}

}  // namespace provider

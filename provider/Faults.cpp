#include "Faults.h"

#include <algorithm>

namespace provider {

namespace {

struct KindName {
    FaultKind kind;
    std::string_view name;
};
constexpr KindName kKindNames[] = {{FaultKind::kStatus, "status"},
                                   {FaultKind::kDelay, "delay"},
                                   {FaultKind::kReset, "reset"},
                                   {FaultKind::kCut, "cut"},
                                   {FaultKind::kCorruptGzip, "corrupt-gzip"},
                                   {FaultKind::kShortGzip, "short-gzip"},
                                   {FaultKind::kBody, "body"},
                                   {FaultKind::kRewrite, "rewrite"}};

int wholeNumber(const Json& body, const char* name, int fallback, int low, int high) {
    const auto found = body.find(name);
    if (found == body.end()) return fallback;
    if (!found->is_number_integer() || *found < low || *found > high)
        invalid(name, "not a number in its range");
    return found->get<int>();
}

}  // namespace

Match Match::parse(const Json& body) {
    Match match;
    for (const char* name : {"method", "path"}) {
        if (body.contains(name) && !body.at(name).is_string()) invalid(name, "must be a string");
    }
    match.method = body.value("method", "*");
    match.pathText = body.value("path", "");
    try {
        match.path = std::regex(match.pathText, std::regex::ECMAScript | std::regex::optimize);
    } catch (const std::regex_error&) {
        invalid("path", "not a regular expression");
    }
    return match;
}

bool Match::fits(const Call& call) const {
    return (method.empty() || method == "*" || method == call.method) && std::regex_search(call.target, path);
}

Fault Fault::parse(const Json& body) {
    constexpr std::string_view kKnown[] = {"method", "path",    "count",         "kind", "status", "delayMs",
                                           "body",   "headers", "afterHandling", "from", "to"};
    for (const auto& [name, value] : body.items()) {
        if (std::find(std::begin(kKnown), std::end(kKnown), name) == std::end(kKnown))
            invalid(name, "unknown");
    }
    Fault fault;
    fault.match = Match::parse(body);
    const Json kind = body.value("kind", Json("status"));
    const auto row = std::find_if(std::begin(kKindNames), std::end(kKindNames),
                                  [&](const KindName& known) { return kind == Json(known.name); });
    if (row == std::end(kKindNames)) invalid("kind", "unknown");
    fault.kind = row->kind;
    fault.count = wholeNumber(body, "count", 1, 1, 1000000);
    fault.status = wholeNumber(body, "status", 0, 200, 599);
    fault.delay = std::chrono::milliseconds(wholeNumber(body, "delayMs", 0, 0, 600000));
    if (body.contains("body")) {
        // An object is a convenience for its text.
        fault.body =
            body.at("body").is_string() ? body.at("body").get<std::string>() : body.at("body").dump();
    }
    const Json headers = body.value("headers", Json::object());
    if (!headers.is_object()) invalid("headers", "must be an object");
    for (const auto& [name, value] : headers.items()) {
        if (!value.is_string()) invalid("headers", "must hold strings");
        fault.headers[name] = value.get<std::string>();
    }
    const Json after = body.value("afterHandling", Json(false));
    if (!after.is_boolean()) invalid("afterHandling", "must be a boolean");
    // These spoil a reply, so that there has to be one.
    fault.afterHandling = after.get<bool>() || fault.kind == FaultKind::kCut ||
                          fault.kind == FaultKind::kCorruptGzip || fault.kind == FaultKind::kShortGzip ||
                          fault.kind == FaultKind::kRewrite;
    for (const auto& [name, text] : {std::pair("from", &fault.from), std::pair("to", &fault.to)}) {
        const Json value = body.value(name, Json(""));
        if (!value.is_string()) invalid(name, "must be a string");
        *text = value.get<std::string>();
    }
    if (fault.kind == FaultKind::kRewrite && fault.from.empty()) invalid("from", "missing");
    return fault;
}

void Fault::rewrite(Call& call) const {
    if (kind != FaultKind::kRewrite) return;
    const std::size_t at = call.body.find(from);
    if (at != std::string::npos) call.body.replace(at, from.size(), to);
}

Json Fault::json() const {
    const auto row = std::find_if(std::begin(kKindNames), std::end(kKindNames),
                                  [&](const KindName& known) { return known.kind == kind; });
    return {{"method", match.method}, {"path", match.pathText}, {"kind", row->name}, {"left", count}};
}

void Faults::add(Fault fault) {
    const std::lock_guard lock(mMutex);
    mFaults.push_back(std::move(fault));
}

std::optional<Fault> Faults::take(const Call& call) {
    const std::lock_guard lock(mMutex);
    for (auto fault = mFaults.begin(); fault != mFaults.end(); ++fault) {
        if (!fault->match.fits(call)) continue;
        Fault taken = *fault;
        if (--fault->count == 0) mFaults.erase(fault);
        return taken;
    }
    return std::nullopt;
}

Json Faults::list() const {
    const std::lock_guard lock(mMutex);
    Json out = Json::array();
    for (const Fault& fault : mFaults) out.push_back(fault.json());
    return out;
}

void Faults::clear() {
    const std::lock_guard lock(mMutex);
    mFaults.clear();
}

void Faults::hold(Match match) {
    const std::lock_guard lock(mMutex);
    mHolds.push_back(std::move(match));
}

void Faults::release() {
    const std::lock_guard lock(mMutex);
    mHolds.clear();
    ++mReleases;
    mChanged.notify_all();
}

Json Faults::holds() const {
    const std::lock_guard lock(mMutex);
    Json rules = Json::array();
    for (const Match& match : mHolds) rules.push_back({{"method", match.method}, {"path", match.pathText}});
    return {{"waiting", mHeld}, {"holds", rules}};
}

bool Faults::waitForHeld(std::size_t count, std::chrono::milliseconds limit) {
    std::unique_lock lock(mMutex);
    return mChanged.wait_for(lock, limit, [&] { return mStopped || mHeld >= count; }) && mHeld >= count;
}

void Faults::pass(const Call& call) {
    std::unique_lock lock(mMutex);
    const bool isHeld =
        std::any_of(mHolds.begin(), mHolds.end(), [&](const Match& match) { return match.fits(call); });
    if (!isHeld) return;
    ++mHeld;
    mChanged.notify_all();
    mChanged.wait(lock, [&, releases = mReleases] { return mStopped || mReleases != releases; });
    --mHeld;
}

void Faults::pause(std::chrono::milliseconds time) {
    std::unique_lock lock(mMutex);
    mChanged.wait_for(lock, time, [&] { return mStopped; });
}

void Faults::stop() {
    const std::lock_guard lock(mMutex);
    mStopped = true;
    mChanged.notify_all();
}

}  // namespace provider

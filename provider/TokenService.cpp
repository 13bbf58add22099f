#include <map>

#include "Services.h"

namespace provider {

namespace {

// The token endpoint has an error form of its own.
Reply refuse(int status, const char* error, const char* description) {
    return jsonReply({{"error", error}, {"error_description", description}}, status);
}

// Values are taken as they stand: clients send them without percent-encoding, also with a '=' inside.
bool readForm(const std::string& body, std::map<std::string, std::string>& form) {
    for (const std::string& pair : splitText(body, '&')) {
        const std::size_t equals = pair.find('=');
        if (equals == 0 || equals == std::string::npos) return false;
        if (!form.emplace(pair.substr(0, equals), pair.substr(equals + 1)).second) return false;
    }
    return true;
}

}  // namespace

void TokenService::addRoutes(Router& router) {
    router.add("POST", "/o/oauth2/token", Access::kOpen, [this](const Call& call) { return grant(call); });
}

Reply TokenService::grant(const Call& call) {
    const std::string type = call.header("Content-Type");
    std::map<std::string, std::string> form;
    if (!type.starts_with("application/x-www-form-urlencoded")) {
        return refuse(400, "invalid_request", "The body must be a form.");
    }
    if (!call.query.empty() || !readForm(call.body, form)) {
        return refuse(400, "invalid_request", "Malformed form body.");
    }
    for (const char* name : {"grant_type", "client_id", "client_secret", "refresh_token"}) {
        if (form[name].empty()) return refuse(400, "invalid_request", "A parameter is missing.");
    }
    const auto lock = mContext.store.guard();
    if (form["client_id"] != mContext.store.clientId ||
        form["client_secret"] != mContext.store.clientSecret) {
        return refuse(401, "invalid_client", "The OAuth client was not found.");
    }
    if (form["grant_type"] != "refresh_token") {
        return refuse(400, "unsupported_grant_type", "Only refresh_token is supported.");
    }
    for (const auto& [email, account] : mContext.store.accounts()) {
        if (account.refreshToken != form["refresh_token"]) continue;
        Reply reply = jsonReply({{"access_token", mContext.tokens.issue(email)},
                                 {"expires_in", mContext.tokens.lifetime().count()},
                                 {"token_type", "Bearer"}});
        reply.headers["Cache-Control"] = "no-store";
        return reply;
    }
    return refuse(400, "invalid_grant", "Token has been expired or revoked.");
}

}  // namespace provider

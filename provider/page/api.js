// The provider's admin services.

// The provider said no.
export class Refused extends Error {
    constructor(status, message) {
        super(message);
        this.status = status;
    }
}
// Nobody answered.
export class Unreachable extends Error {}

export const pathOf = (...parts) => "/admin/" + parts.map(encodeURIComponent).join("/");
export const accountPath = (email, ...parts) => pathOf("accounts", email, ...parts);

const TIME_LIMIT_MS = 20_000;

// Options: `json` or `file` is the body; `etag` is what the item must still have.
export async function call(method, path, {json, file, etag, limitMs = TIME_LIMIT_MS} = {}) {
    const headers = {};
    if (json) headers["Content-Type"] = "application/json";
    if (file) headers["Content-Type"] = file.type || "application/octet-stream";
    if (etag) headers["If-Match"] = etag;
    let response;
    let text;
    try {
        response = await fetch(path, {
            method, headers, body: json ? JSON.stringify(json) : file, signal: AbortSignal.timeout(limitMs)});
        text = await response.text();
    } catch {
        throw new Unreachable("The provider does not answer.");
    }
    let body = {};
    try {
        body = JSON.parse(text);
    } catch {
        if (response.ok) throw new Refused(response.status, "The provider's answer is not JSON.");
    }
    if (!response.ok) throw new Refused(response.status, body.error?.message ?? `Status ${response.status}`);
    return body;
}

const NEWS_EVERY_MS = 500;
const RETRY_EVERY_MS = 1000;
const NEWS_LIMIT_MS = 5000;

// Asks for news as long as the page is open and seen. `heard(news, isNewRun)` is awaited before the next look;
// `lost()` is called for each look without an answer.
export async function watchNews(heard, lost) {
    let run = "";
    let last = 0;
    for (;;) {
        let pause = NEWS_EVERY_MS;
        try {
            let news = await call("GET", `/admin/news?since=${last}`, {limitMs: NEWS_LIMIT_MS});
            const isNewRun = news.run !== run;
            if (isNewRun && last > 0) news = await call("GET", "/admin/news", {limitMs: NEWS_LIMIT_MS});
            await heard(news, isNewRun);
            run = news.run;
            last = news.last;
        } catch (error) {
            if (!(error instanceof Unreachable)) console.error(error);
            lost();
            pause = RETRY_EVERY_MS;
        }
        await new Promise((resolve) => { setTimeout(resolve, pause); });
        await untilSeen();
    }
}

function untilSeen() {
    if (!document.hidden) return Promise.resolve();
    return new Promise((resolve) => {
        document.addEventListener("visibilitychange", resolve, {once: true});
    });
}

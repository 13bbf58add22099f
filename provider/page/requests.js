// The requests of devices as they happen.
import {byId, el} from "./dom.js";

const KEPT = 200;

const statusKind = (status) => status === 0 || status >= 500 ? "bad" : status >= 400 ? "odd" : "good";

function readable(path) {
    try {
        return decodeURIComponent(path);
    } catch {
        return path;
    }
}

function row(request, isFresh) {
    return el("tr", {class: isFresh ? "fresh" : ""},
        el("td", {}, el("span", {class: `method ${request.method.toLowerCase()}`}, request.method)),
        el("td", {class: "path", title: request.account || null}, readable(request.path)),
        el("td", {class: statusKind(request.status)}, request.status === 0 ? "reset" : String(request.status)),
        el("td", {class: "number"}, request.ms.toFixed(1)));
}

// `total`: how many there were since the provider started.
export function showRequests(requests, total, isFirst) {
    byId("request-count").textContent = total === 0 ? "none yet" : `${total.toLocaleString("en")} since its start`;
    if (requests.length === 0) return;
    const rows = byId("request-rows");
    rows.prepend(...requests.map((request) => row(request, !isFirst)).reverse());
    while (rows.children.length > KEPT) rows.lastElementChild.remove();
    byId("no-requests").hidden = true;
}

export function clearRequests() {
    byId("request-rows").replaceChildren();
    byId("no-requests").hidden = false;
}

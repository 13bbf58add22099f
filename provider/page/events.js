// Events: calendars of the account, the list of one calendar's events, and their form.
import {accountPath, call, pathOf} from "./api.js";
import {badge, byId, data, el, setColor, showChoice, toast} from "./dom.js";
import {edit} from "./editor.js";
import {endOf, lastDayOf, spanField, textField} from "./fields.js";
import {Listing} from "./listing.js";
import {ownZone, readTime, repeatText, soon, moveWall, spanText, writeTime} from "./times.js";

const HOUR_MS = 3_600_000;
const ROLES = {reader: "read only for devices", writer: "shared", owner: ""};
const TEXTS = [["title", "summary"], ["location", "location"], ["description", "description"]];

let account = "";
let calendars = [];
let chosen = null;
let listing = null;

const isCancelled = (event) => event.status === "cancelled";
const titleOf = (event) => event.summary ?? "";

function spanOf(event) {
    const start = readTime(event.start ?? event.originalStartTime);
    const end = readTime(event.end) ?? start;
    if (!start) return {allDay: false, start: "", end: ""};
    return {allDay: start.allDay, start: start.wall, end: start.allDay && event.end ? lastDayOf(end.wall) : end.wall};
}

// Both ends in one, since both are dates or neither is. A zone that the event has stays.
function timesOf(span, event) {
    const end = span.allDay ? endOf(span.end) : span.end;
    const old = {start: readTime(event?.start), end: readTime(event?.end)};
    const write = (wall, from) => {
        const zone = from && !from.allDay ? from.zone : ownZone();
        return writeTime(wall, zone, from?.offset);
    };
    return {start: write(span.start, old.start), end: write(end, old.end ?? old.start)};
}

const eventKind = {
    name: "event",
    title: titleOf,
    fields: () => [textField("title", "Title"), spanField("span"), textField("location", "Location"),
        textField("description", "Description", {rows: 4})],
    values(event) {
        if (!event) {
            const start = soon();
            const span = {allDay: false, start, end: moveWall(start, HOUR_MS)};
            return {title: "", span, location: "", description: ""};
        }
        const texts = TEXTS.map(([field, member]) => [field, event[member] ?? ""]);
        return {...Object.fromEntries(texts), span: spanOf(event)};
    },
    fault({span}) {
        if (!span.start || !span.end) return "Start and end are needed.";
        return span.end < span.start ? "The end is before the start." : "";
    },
    body(values, base, event) {
        const body = {};
        for (const [field, member] of TEXTS) {
            if (values[field] !== base[field]) body[member] = values[field] || null;
        }
        if (!event || JSON.stringify(values.span) !== JSON.stringify(base.span)) {
            Object.assign(body, timesOf(values.span, event));
        }
        // A cancelled instance that is saved takes place again.
        if (event && isCancelled(event)) body.status = "confirmed";
        return body;
    },
    deletes(event) {
        if (isCancelled(event)) return "";
        return event.recurringEventId ? "Cancel this day" : event.recurrence ? "Delete the series" : "Delete";
    },
    note(event) {
        if (!event) return `Times are those of ${ownZone()}.`;
        const zone = readTime(event.start)?.zone || readTime(event.start)?.offset;
        const notes = [];
        if (event.recurrence) {
            notes.push(`A series, ${repeatText(event.recurrence)}: what you change is changed for all days.`);
        }
        if (event.recurringEventId) notes.push("One day of a series.");
        if (isCancelled(event)) notes.push("It is cancelled; saving brings it back.");
        if (zone) notes.push(`Times are those of ${zone === "Z" ? "UTC" : zone}.`);
        return notes.join(" ");
    },
};

async function open(event) {
    const path = eventsPath();
    // A cancelled instance is listed with next to nothing; the series tells what it would be.
    if (isCancelled(event)) {
        const series = await call("GET", `${path}/${encodeURIComponent(event.recurringEventId)}`).catch(() => null);
        if (!series) {
            toast("Only the series of this day could bring it back, and that is not here.");
            return;
        }
        event = {...series, ...event, recurrence: undefined, ...instanceTimes(series, event)};
    }
    edit(eventKind, path, event);
}

function instanceTimes(series, instance) {
    const [from, start, end] = [instance.originalStartTime, series.start, series.end].map(readTime);
    if (!from || !start || !end) return {};
    const length = Date.parse(`${end.wall}Z`) - Date.parse(`${start.wall}Z`);
    return {start: instance.originalStartTime, end: writeTime(moveWall(from.wall, length), from.zone, from.offset)};
}

function row(event, {series}) {
    const name = series[event.recurringEventId];
    const of = event.recurringEventId ? ` of ${name ? `“${name}”` : "a series"}` : "";
    const title = titleOf(event) || (isCancelled(event) && name) || "(no title)";
    const badges = [
        event.recurrence && badge(`↻ ${repeatText(event.recurrence)}`, "series", event.recurrence.join("\n")),
        isCancelled(event) && badge(`cancelled day${of}`, "cancelled"),
        event.recurringEventId && !isCancelled(event) && badge(`changed day${of}`, "instance"),
        event.status === "tentative" && badge("tentative"),
        ["private", "confidential"].includes(event.visibility) && badge(event.visibility),
    ].filter(Boolean);
    return el("button", {type: "button", class: `row event ${isCancelled(event) ? "is-cancelled" : ""}`,
        onclick: () => open(event)},
    data(title, "strong"),
    el("span", {class: "meta"}, el("span", {}, spanText(event.start ?? event.originalStartTime, event.end)),
        event.location ? data(event.location, "span", {class: "place"}) : null),
    badges.length > 0 ? el("span", {class: "badges"}, ...badges) : null);
}

const eventsPath = () => chosen && pathOf("calendars", chosen, "events");

export function setUpEvents() {
    listing = new Listing(byId("events").querySelector(".listing"),
        {path: eventsPath, row, noun: ["event", "events"], placeOrder: "By date"});
    byId("add-event").addEventListener("click", () => edit(eventKind, eventsPath(), null));
}

export async function showEvents(email) {
    ({calendars} = await call("GET", accountPath(email, "calendars")));
    account = email;
    if (!calendars.some((calendar) => calendar.id === chosen)) chosen = calendars[0]?.id ?? null;
    byId("add-event").disabled = chosen === null;
    showCalendars();
    await listing.refresh();
}

function showCalendars() {
    const options = calendars.map((calendar) => ({id: calendar.id, label: calendar.summary,
        color: calendar.backgroundColor, note: ROLES[calendar.accessRole] ?? ""}));
    showChoice(byId("calendars"), "calendar", options, chosen, (id) => {
        chosen = id;
        showEvents(account).catch(console.error);
    });
    const color = calendars.find((calendar) => calendar.id === chosen)?.backgroundColor ?? "";
    setColor(listing.list, color);
}

// Times of events: {"date"} or {"dateTime", "timeZone"} on the wire, the time on a wall clock for people.

const DAY_MS = 86_400_000;
const HERE = Intl.DateTimeFormat().resolvedOptions().timeZone;

export const ownZone = () => HERE;

const stampOf = (wall) => Date.parse(wall.length === 10 ? `${wall}T00:00Z` : `${wall}Z`);

// Milliseconds by which the zone's clocks are ahead of UTC at an instant; throws RangeError for an unknown zone.
function zoneOffset(zone, instant) {
    const parts = new Intl.DateTimeFormat("en-US", {timeZone: zone, hourCycle: "h23", year: "numeric", month: "numeric",
        day: "numeric", hour: "numeric", minute: "numeric", second: "numeric"}).formatToParts(instant);
    const part = Object.fromEntries(parts.map(({type, value}) => [type, Number(value)]));
    const wall = Date.UTC(part.year, part.month - 1, part.day, part.hour, part.minute, part.second);
    return wall - Math.floor(instant / 1000) * 1000;
}

function isZone(zone) {
    try {
        zoneOffset(zone, 0);
        return Boolean(zone);
    } catch {
        return false;
    }
}

function offsetText(milliseconds) {
    const minutes = Math.round(Math.abs(milliseconds) / 60_000);
    if (minutes === 0) return "Z";
    const two = (number) => String(number).padStart(2, "0");
    return `${milliseconds < 0 ? "-" : "+"}${two(Math.floor(minutes / 60))}:${two(minutes % 60)}`;
}

function wallText(stamp) {
    const text = new Date(stamp).toISOString().slice(0, 19);
    return text.endsWith(":00") ? text.slice(0, 16) : text;
}

// {allDay, wall: "2026-03-02" or "2026-03-02T10:00[:30]", zone, offset}; null when it is no time at all.
export function readTime(time) {
    if (typeof time?.date === "string") return {allDay: true, wall: time.date, zone: "", offset: ""};
    const match = /^(\d{4}-\d\d-\d\dT\d\d:\d\d:\d\d)(?:\.\d+)?(Z|[+-]\d\d:\d\d)?$/i.exec(time?.dateTime ?? "");
    if (!match) return null;
    const [, clock, offset = ""] = match;
    const zone = time.timeZone ?? "";
    if (!offset || !isZone(zone)) return {allDay: false, wall: wallText(stampOf(clock)), zone, offset};
    const instant = Date.parse(clock + offset);
    return {allDay: false, wall: wallText(instant + zoneOffset(zone, instant)), zone, offset};
}

// The wire's form of a wall time, in a zone or, when there is none, with an offset.
export function writeTime(wall, zone, offset) {
    if (wall.length === 10) return {date: wall};
    const clock = wall.length === 16 ? `${wall}:00` : wall;
    if (!isZone(zone)) return zone ? {dateTime: clock + offset, timeZone: zone} : {dateTime: clock + (offset || "Z")};
    const stamp = stampOf(wall);
    const guess = zoneOffset(zone, stamp);
    return {dateTime: clock + offsetText(zoneOffset(zone, stamp - guess)), timeZone: zone};
}

export const moveDays = (date, days) => wallText(stampOf(date) + days * DAY_MS).slice(0, 10);
export const moveWall = (wall, milliseconds) =>
    wall.length === 10 ? moveDays(wall, milliseconds / DAY_MS) : wallText(stampOf(wall) + milliseconds);
export const between = (from, to) => stampOf(to) - stampOf(from);
// The next full hour on this machine's clock.
export function soon() {
    const now = Date.now();
    return wallText(Math.ceil((now + zoneOffset(HERE, now)) / 3_600_000) * 3_600_000);
}

export function dateText(date) {
    return new Intl.DateTimeFormat("en-GB", {timeZone: "UTC", weekday: "short", day: "numeric", month: "short",
        year: "numeric"}).format(stampOf(date.slice(0, 10)));
}

// "Mon, 2 Mar 2026, 10:00–11:00 Europe/Berlin"; an all-day event ends on the day before its end.
export function spanText(start, end) {
    const from = readTime(start);
    const to = readTime(end);
    if (!from) return "no time";
    if (from.allDay) {
        const last = to ? moveDays(to.wall, -1) : from.wall;
        return last > from.wall ? `${dateText(from.wall)} – ${dateText(last)}` : dateText(from.wall);
    }
    const place = from.zone || (from.offset === "Z" ? "UTC" : from.offset);
    const zone = place === HERE ? "" : ` ${place}`;
    const head = `${dateText(from.wall)}, ${from.wall.slice(11)}`;
    if (!to || to.allDay || to.wall === from.wall) return head + zone;
    const isSameDay = to.wall.slice(0, 10) === from.wall.slice(0, 10);
    return `${head}–${isSameDay ? "" : `${dateText(to.wall)}, `}${to.wall.slice(11)}${zone}`;
}

const UNITS = {SECONDLY: "second", MINUTELY: "minute", HOURLY: "hour", DAILY: "day", WEEKLY: "week", MONTHLY: "month",
    YEARLY: "year"};
const DAYS = {MO: "Mon", TU: "Tue", WE: "Wed", TH: "Thu", FR: "Fri", SA: "Sat", SU: "Sun"};

// "every 2 weeks on Mon, Fri, 10 times". What it leaves out of a rule the row's title shows.
export function repeatText(lines) {
    const rule = lines.find((line) => line.startsWith("RRULE:"));
    if (!rule) return "on several days";
    const parts = Object.fromEntries(rule.slice(6).split(";").map((part) => part.split("=")));
    const unit = UNITS[parts.FREQ] ?? parts.FREQ;
    const interval = Number(parts.INTERVAL ?? 1);
    const texts = [interval > 1 ? `every ${interval} ${unit}s` : `every ${unit}`];
    if (parts.BYDAY) {
        const dayText = (day) => day.replace(/[A-Z]{2}$/, (name) => ` ${DAYS[name] ?? name}`).trim();
        texts[0] += ` on ${parts.BYDAY.split(",").map(dayText).join(", ")}`;
    }
    if (parts.COUNT) texts.push(`${parts.COUNT} times`);
    if (parts.UNTIL) texts.push(`until ${dateText(parts.UNTIL.replace(/^(\d{4})(\d\d)(\d\d).*$/, "$1-$2-$3"))}`);
    return texts.join(", ");
}

import assert from "node:assert/strict";
import {after, before, beforeEach, test} from "node:test";
import {Provider, eventually, listed, makeDevice, openBrowser, sync, tool} from "./world.js";

const PNG = Buffer.from("iVBORw0KGgoAAAANSUhEUgAAAAEAAAABCAYAAAAfFcSJAAAADUlEQVR4nGP4z8DwHwAFAAH/iZk9HQAAAABJRU5ErkJg" +
    "gg==", "base64");
const HOSTILE = `<img src=x onerror="window.hit=1"><script>window.hit=1</script>&amp;"'\u202Etxt`;

const provider = new Provider("main", "sample");
let account;
let browser;
let page;
const complaints = [];

before(async () => {
    await provider.start();
    account = makeDevice(provider);
    browser = await openBrowser();
    const context = await browser.newContext({viewport: {width: 1400, height: 900}, timezoneId: "Europe/Berlin"});
    page = await context.newPage();
    page.setDefaultTimeout(15_000);
    page.on("pageerror", (error) => complaints.push(error.message));
    page.on("console", (message) => {
        if (message.text().includes("Content Security Policy")) complaints.push(message.text());
    });
});

// One test that fails leaves nothing open for the next.
beforeEach(async () => {
    await page.goto("about:blank");
    await page.goto(provider.url);
    await page.getByText("Live", {exact: true}).waitFor();
});

after(async () => {
    await browser?.close();
    try {
        tool(["daemon", "stop"]);
    } finally {
        assert.equal(await provider.stop(), 0);
    }
    assert.deepEqual(complaints, []);
});

const show = (view) => page.locator(`nav a[href="#${view}"]`).click();
const row = (view, text) => page.locator(`#${view} li`, {hasText: text});
const form = () => page.locator("#editor");
const press = (name) => form().getByRole("button", {name, exact: true}).click();

// A step is [what, label, value].
async function fill(steps) {
    for (const [what, label, value] of steps) {
        const field = form().getByLabel(label, {exact: true});
        if (what === "press") await press(label);
        else if (what === "type") await field.last().fill(value);
        else if (what === "check") await field.setChecked(value);
        else if (what === "choose") await field.last().selectOption({label: value});
        else if (what === "file") await field.setInputFiles({name: "a.png", mimeType: "image/png", buffer: value});
    }
    await press("Save");
    await form().waitFor({state: "hidden"});
}

// What is done on the page, and what the device then has.
const ROUND_TRIPS = [
    {
        name: "event", view: "events", list: "events", key: (event) => event.summary,
        add: [["type", "Title", "Timed zebra"], ["type", "Start", "2026-06-01T10:00"], ["type", "Location", "Room <1>"],
            ["type", "Description", "Two\nlines"]],
        edit: [["type", "Start", "2026-12-01T09:30"], ["type", "Location", ""]],
        look: ({start, end, location = "", description}) => ({start, end, location, description}),
        added: {start: "2026-06-01T08:00:00Z", end: "2026-06-01T09:00:00Z", location: "Room <1>",
            description: "Two\nlines"},
        edited: {start: "2026-12-01T08:30:00Z", end: "2026-12-01T09:30:00Z", location: "",
            description: "Two\nlines"},
    },
    {
        name: "event", view: "events", list: "events", key: (event) => event.summary,
        add: [["type", "Title", "Whole zebra"], ["check", "All day", true], ["type", "Start", "2026-06-01"],
            ["type", "End", "2026-06-02"]],
        edit: [["check", "All day", false], ["type", "Start", "2026-06-01T20:00"]],
        look: ({start, end}) => ({start, end}),
        added: {start: "2026-06-01", end: "2026-06-03"},
        edited: {start: "2026-06-01T18:00:00Z", end: "2026-06-02T19:00:00Z"},
    },
    {
        name: "task", view: "tasks", list: "todos", key: (task) => task.summary,
        add: [["type", "Title", "Buy a zebra"], ["type", "Notes", "Ten"], ["type", "Due", "2026-06-02"]],
        edit: [["type", "Notes", "Eleven"], ["check", "Done", true]],
        look: ({note, due, status}) => ({note, due: due?.slice(0, 10), status}),
        added: {note: "Ten", due: "2026-06-02", status: "needsAction"},
        edited: {note: "Eleven", due: "2026-06-02", status: "completed"},
    },
    {
        name: "contact", view: "contacts", list: "contacts", key: (contact) => contact.name?.first,
        add: [["type", "First name", "Dora"], ["type", "Last name", "O'Neil"], ["press", "Add e-mail address"],
            ["type", "e-mail address", "d@provider.example"], ["press", "Add phone number"],
            ["choose", "Type of the phone number", "work"], ["type", "phone number", "+49 30 1"], ["type", "Note", "N"],
            ["check", "Family", true], ["file", "Photo", PNG]],
        edit: [["type", "Last name", "Neil"], ["press", "Remove this e-mail address"], ["check", "Family", false],
            ["press", "Remove photo"]],
        look: (contact) => ({last: contact.name.last, emails: (contact.emails ?? []).map(({value}) => value),
            phones: contact.phones.map(({value, type}) => `${type} ${value}`), note: contact.note,
            groups: contact.groups.length, photo: Boolean(contact.photo)}),
        added: {last: "O'Neil", emails: ["d@provider.example"], phones: ["work +49 30 1"], note: "N", groups: 2,
            photo: true},
        edited: {last: "Neil", emails: [], phones: ["work +49 30 1"], note: "N", groups: 1, photo: false},
    },
];

for (const trip of ROUND_TRIPS) {
    const title = trip.add[0][2];
    test(`a ${trip.name} (${title}) of the page comes to the device, changes and goes there`, async () => {
        const onDevice = () => listed(trip.list).filter((record) => trip.key(record) === title);
        const shown = row(trip.view, title).locator(".row");
        await show(trip.view);
        await page.getByRole("button", {name: `New ${trip.name}`}).click();
        await fill(trip.add);
        await shown.waitFor();
        sync();
        assert.deepEqual(onDevice().map(trip.look), [trip.added]);
        await shown.click();
        await fill(trip.edit);
        sync();
        assert.deepEqual(onDevice().map(trip.look), [trip.edited]);
        await shown.click();
        await press("Delete");
        await press("Really? Press again");
        await form().waitFor({state: "hidden"});
        await shown.waitFor({state: "detached"});
        sync();
        assert.deepEqual(onDevice(), []);
    });
}

test("what is added, changed and deleted on the device appears on the page without a reload", async () => {
    const books = listed("calendars");
    const personal = books.find(({name}) => name === "Personal").id;
    const home = books.find(({name}) => name === "Home").id;
    const cases = [
        ["events", "event", ["--calendar", personal], "summary=Moved",
            {summary: "Made there", start: "2026-07-01T10:00:00Z", end: "2026-07-01T11:00:00Z"}],
        ["tasks", "todo", ["--calendar", home], "summary=Moved", {summary: "Made there"}],
        ["contacts", "contact", ["--account", "1"], "first=Moved", {name: {first: "Made there"}}],
    ];
    await page.evaluate(() => { window.isSamePage = true; });
    for (const [view, noun, where, change, record] of cases) {
        await show(view);
        const id = tool([noun, "add", ...where.map(String), "-"], JSON.stringify(record)).trim();
        await row(view, "Made there").waitFor();
        tool([noun, "set", id, change]);
        await row(view, "Moved").waitFor();
        tool([noun, "delete", id]);
        await row(view, "Moved").waitFor({state: "detached"});
    }
    assert.equal(await page.evaluate(() => window.isSamePage), true);
    await page.locator("#request-rows tr", {hasText: "DELETE"}).first().waitFor();
});

test("texts of others are shown as texts", async () => {
    const {email} = account;
    const list = await provider.admin("POST", `/accounts/${email}/tasklists`, {title: HOSTILE});
    const calendar = await provider.admin("POST", `/accounts/${email}/calendars`, {summary: HOSTILE});
    const day = {start: {date: "2026-08-01"}, end: {date: "2026-08-02"}};
    await provider.admin("POST", `/calendars/${calendar.id}/events`,
        {...day, summary: HOSTILE, location: HOSTILE, description: HOSTILE});
    await provider.admin("POST", `/accounts/${email}/tasklists/${list.id}/tasks`, {title: HOSTILE, notes: HOSTILE});
    await provider.admin("POST", `/accounts/${email}/groups`, {id: "bad", title: {$t: HOSTILE}});
    await provider.admin("POST", `/accounts/${email}/contacts`, {gd$name: {gd$givenName: {$t: HOSTILE}},
        gd$email: [{label: HOSTILE, address: HOSTILE}], content: {$t: HOSTILE},
        gContact$groupMembershipInfo: [{href: "/m8/feeds/groups/default/base/bad"}]});
    for (const [view, choice, label] of [["events", "#calendars", "Title"], ["tasks", "#tasklists", "Title"],
        ["contacts", null, "First name"]]) {
        await show(view);
        if (choice) await page.locator(choice).getByText(HOSTILE).click();
        await row(view, HOSTILE).locator(".row").click();
        assert.equal(await form().getByLabel(label, {exact: true}).inputValue(), HOSTILE);
        await press("Close");
    }
    assert.equal(await page.locator('img[src="x"], main script').count(), 0);
    assert.equal(await page.evaluate(() => window.hit), undefined);
});

test("an edit keeps what the form does not show and what others changed meanwhile", async () => {
    const contact = `/accounts/${account.email}/contacts/ada`;
    const before = await provider.admin("GET", contact);
    await show("contacts");
    await row("contacts", "Lindqvist").locator(".row").click();
    await form().getByLabel("Last name").fill("Changed here");
    await provider.admin("PATCH", contact, {content: {$t: "Changed there"}, gContact$hobby: [{$t: "Chess"}]});
    await press("Save");
    await form().getByText("changed elsewhere").waitFor();
    assert.equal(await form().getByLabel("Note").inputValue(), "Changed there");
    assert.equal(await form().getByLabel("Last name").inputValue(), "Changed here");
    await fill([]);
    const now = await provider.admin("GET", contact);
    const expected = {...before, content: {$t: "Changed there"}, gContact$hobby: [{$t: "Chess"}],
        gd$name: {...before.gd$name, gd$familyName: {...before.gd$name.gd$familyName, $t: "Changed here"}}};
    for (const own of ["etag", "updated", "title"]) delete expected[own], delete now[own];
    assert.deepEqual(now, expected);
});

test("a page that is open while the provider restarts says so and comes back, with what was typed", async () => {
    await show("tasks");
    // By keyboard alone.
    await page.getByRole("button", {name: "New task"}).focus();
    await page.keyboard.press("Enter");
    await page.keyboard.type("Through a restart");
    assert.equal(await provider.stop(), 0);
    await page.locator("#connection", {hasText: "Connection lost"}).waitFor();
    await page.keyboard.press("Enter");
    await form().getByText("does not answer").waitFor();
    await provider.start();
    await page.getByText("Live", {exact: true}).waitFor();
    await page.keyboard.press("Enter");
    await row("tasks", "Through a restart").waitFor();
    sync();
    assert.ok(await eventually(() => listed("todos").some(({summary}) => summary === "Through a restart")));
});

test("twenty thousand events are counted, found and turned over", async () => {
    const large = new Provider("large", "20000");
    await large.start();
    const tab = await page.context().newPage();
    try {
        await tab.goto(large.url);
        const count = tab.locator("#events .count");
        await tab.getByText("1–50 of 20,000 events").waitFor();
        await tab.getByLabel("Find events").fill("event 19998");
        await tab.getByText("1 found of 20,000 events").waitFor();
        await tab.getByLabel("Find events").fill("");
        await tab.getByText("1–50 of 20,000 events").waitFor();
        await tab.locator("#events").getByRole("button", {name: "Next"}).click();
        await tab.getByText("51–100 of 20,000 events").waitFor();
        await large.admin("DELETE", `/calendars/${large.ready.accounts[0].calendars[0]}/events/${"ev0000000003"}`);
        await tab.getByText("51–100 of 19,999 events").waitFor();
        assert.equal(await tab.locator("#events li").count(), 50, await count.textContent());
    } finally {
        await tab.close();
        await large.stop();
    }
});

test("it fits narrow and wide screens in both colour schemes", async () => {
    for (const width of [360, 1400]) {
        for (const colorScheme of ["light", "dark"]) {
            await page.setViewportSize({width, height: 800});
            await page.emulateMedia({colorScheme});
            for (const view of ["events", "tasks", "contacts"]) {
                await show(view);
                await page.locator(`#${view} li`).first().waitFor();
                const excess = await page.evaluate(() => document.documentElement.scrollWidth - window.innerWidth);
                assert.ok(excess <= 0, `${view} at ${width}: ${excess} px too wide`);
            }
        }
    }
});

// Tasks: task lists of the account, the list of one's tasks, and their form.
import {accountPath, call} from "./api.js";
import {byId, data, el, showChoice, toast} from "./dom.js";
import {edit} from "./editor.js";
import {checkField, textField} from "./fields.js";
import {Listing} from "./listing.js";
import {dateText} from "./times.js";

let account = "";
let lists = [];
let chosen = null;
let listing = null;

const isDone = (task) => task.status === "completed";
const statusOf = (done) => done ? "completed" : "needsAction";

const taskKind = {
    name: "task",
    title: (task) => task.title,
    fields: () => [textField("title", "Title"), textField("notes", "Notes", {rows: 4}),
        textField("due", "Due", {type: "date"}), checkField("done", "Done")],
    values: (task) => ({title: task?.title ?? "", notes: task?.notes ?? "", due: task?.due?.slice(0, 10) ?? "",
        done: task ? isDone(task) : false}),
    body(values, base) {
        const body = {};
        for (const member of ["title", "notes"]) {
            if (values[member] !== base[member]) body[member] = values[member] || null;
        }
        if (values.due !== base.due) body.due = values.due ? `${values.due}T00:00:00Z` : null;
        if (values.done !== base.done) body.status = statusOf(values.done);
        return body;
    },
    deletes: () => "Delete",
    note: (task) => task?.completed ? `Done on ${dateText(task.completed)}.` : "",
};

async function toggle(task, box) {
    try {
        await call("PATCH", `${tasksPath()}/${encodeURIComponent(task.id)}`,
            {json: {status: statusOf(box.checked)}, etag: task.etag});
    } catch (error) {
        box.checked = isDone(task);
        toast(`Not changed: ${error.message}`);
    }
    await listing.refresh().catch(() => {});
}

function row(task) {
    const title = task.title || "(no title)";
    const box = el("input", {type: "checkbox", checked: isDone(task), "aria-label": `Done: ${title}`,
        onchange: () => toggle(task, box)});
    return [box, el("button", {type: "button", class: `row ${isDone(task) ? "is-done" : ""}`,
        onclick: () => edit(taskKind, tasksPath(), task)},
    data(title, "strong"),
    el("span", {class: "meta"}, task.due ? el("span", {}, `due ${dateText(task.due)}`) : null,
        task.notes ? data(task.notes, "span", {class: "place"}) : null))];
}

const tasksPath = () => chosen && accountPath(account, "tasklists", chosen, "tasks");

export function setUpTasks() {
    listing = new Listing(byId("tasks").querySelector(".listing"),
        {path: tasksPath, row, noun: ["task", "tasks"], placeOrder: "By due date"});
    byId("add-task").addEventListener("click", () => edit(taskKind, tasksPath(), null));
}

export async function showTasks(email) {
    ({items: lists} = await call("GET", accountPath(email, "tasklists")));
    account = email;
    if (!lists.some((list) => list.id === chosen)) chosen = lists[0]?.id ?? null;
    byId("add-task").disabled = chosen === null;
    showChoice(byId("tasklists"), "tasklist", lists.map(({id, title}) => ({id, label: title})), chosen, (id) => {
        chosen = id;
        showTasks(account).catch(console.error);
    });
    await listing.refresh();
}

// The form for one item, new or known. It sends what was changed and nothing else; when the item was changed by others
// meanwhile, the provider refuses, and the form takes the others' changes over where nothing was typed.
import {Refused, Unreachable, call} from "./api.js";
import {byId, toast} from "./dom.js";

let open = null;  // {kind, item, path, fields, base, sure}
let refresh = null;

const valuesOf = (fields) => Object.fromEntries(fields.map((field) => [field.name, field.get()]));
const isSame = (a, b) => JSON.stringify(a) === JSON.stringify(b);
const isTouched = () => !isSame(valuesOf(open.fields), open.base);

function say(text) {
    byId("editor-message").textContent = text;
}

// `path`: the list's address; `item`: null for a new one; `kind` says what is special about the items:
//   name, title(item)          what it is called
//   fields(item)               the fields of its form
//   values(item)               what they show, by their names
//   body(values, base, item)   what a request needs to turn base into values
//   deletes(item)              the text of the button that deletes it; empty: there is none
// and, if it has them: note(item), fault(values), and after(path, values, base), which runs when the item was saved.
export function edit(kind, path, item) {
    open = {kind, path, fields: kind.fields(item), item: null, base: {}, sure: ""};
    byId("editor-fields").replaceChildren(...open.fields.map((field) => field.element));
    take(item, kind.values(item));
    say("");
    byId("editor").showModal();
    byId("editor-fields").querySelector("input:not([type=file]), textarea")?.focus();
}

// The form is about this state of the item now; fields in which something was typed keep it.
function take(item, values, touched = new Set()) {
    open.item = item;
    for (const field of open.fields) {
        if (!touched.has(field.name)) field.set(values[field.name]);
    }
    // As the fields give them back: they may tidy what they are given.
    const now = valuesOf(open.fields);
    for (const name of Object.keys(now)) open.base[name] = touched.has(name) ? values[name] : now[name];
    const {kind} = open;
    byId("editor-heading").textContent = item ? `Edit ${kind.name}` : `New ${kind.name}`;
    byId("editor-note").textContent = kind.note?.(item) ?? "";
    const remove = byId("editor-delete");
    remove.hidden = !item || !kind.deletes(item);
    remove.textContent = item ? kind.deletes(item) : "";
}

const itemPath = () => `${open.path}/${encodeURIComponent(open.item.id)}`;

async function takeOthersChanges() {
    const now = valuesOf(open.fields);
    const touched = new Set(Object.keys(now).filter((name) => !isSame(now[name], open.base[name])));
    const item = await call("GET", itemPath());
    take(item, open.kind.values(item), touched);
    say("This was changed elsewhere meanwhile. What you did not touch shows the new state; look and try again.");
}

async function attempt(action) {
    const form = open;
    byId("editor-save").disabled = byId("editor-delete").disabled = true;
    say("");
    try {
        await action();
    } catch (error) {
        if (open !== form) return;
        if (error instanceof Refused && error.status === 412) {
            await takeOthersChanges().catch((later) => say(later.message));
        } else if (error instanceof Refused && [404, 410].includes(error.status) && open.item) {
            say("This is gone: it was deleted elsewhere meanwhile.");
        } else if (error instanceof Unreachable) {
            say("The provider does not answer. What you typed is still here; try again.");
        } else {
            say(error.message);
        }
    } finally {
        byId("editor-save").disabled = byId("editor-delete").disabled = false;
    }
}

async function save() {
    const {kind, path, base, item} = open;
    const values = valuesOf(open.fields);
    const fault = kind.fault?.(values);
    if (fault) {
        say(fault);
        return;
    }
    await attempt(async () => {
        const body = kind.body(values, base, item);
        if (!item) {
            open.item = await call("POST", path, {json: body});
        } else if (Object.keys(body).length > 0) {
            open.item = await call("PATCH", itemPath(), {json: body, etag: item.etag});
        }
        // From here on it is saved; what follows is tried again without saving it once more.
        const saved = open.item;
        open.base = {...values, photo: base.photo};
        await kind.after?.(itemPath(), values, base);
        await finish(`Saved: ${kind.title(saved) || "without a title"}`);
    });
}

async function remove() {
    const button = byId("editor-delete");
    if (open.sure !== open.item.etag) {
        open.sure = open.item.etag;
        button.textContent = "Really? Press again";
        return;
    }
    await attempt(async () => {
        await call("DELETE", itemPath(), {etag: open.item.etag});
        await finish(`Deleted: ${open.kind.title(open.item) || "without a title"}`);
    });
    if (open) open.sure = "";
}

// What is behind the form is as new as what was saved when the form goes.
async function finish(text) {
    await refresh().catch(() => {});
    const id = open?.item?.id ?? "";
    close();
    // The row from which the form was opened may be another element by now.
    if (document.activeElement === document.body) {
        document.querySelector(`li[data-id="${CSS.escape(id)}"] button`)?.focus();
    }
    toast(text);
}

function close() {
    open = null;
    byId("editor").close();
}

// The first attempt to leave typed things behind only says so.
function leave(event) {
    if (open && isTouched() && open.sure !== "leave") {
        event.preventDefault();
        open.sure = "leave";
        say("Not saved yet. Close once more to drop what you typed.");
        return;
    }
    close();
}

// `whenChanged()` shows the lists anew.
export function setUpEditor(whenChanged) {
    refresh = whenChanged;
    const dialog = byId("editor");
    // Choosing a file has a "cancel" of its own, which comes by here.
    dialog.addEventListener("cancel", (event) => event.target === dialog && leave(event));
    dialog.addEventListener("close", () => { open = null; });
    byId("editor-close").addEventListener("click", leave);
    byId("editor-delete").addEventListener("click", remove);
    dialog.querySelector("form").addEventListener("submit", (event) => {
        event.preventDefault();
        save();
    });
}

// The fields of a form: {name, element, get(), set(value)}.
import {byId, data, el} from "./dom.js";
import {between, moveDays, moveWall} from "./times.js";

let count = 0;
const nextId = () => `field-${++count}`;

export function textField(name, label, {type = "text", rows = 0, width = ""} = {}) {
    const id = nextId();
    const input = rows > 0 ? el("textarea", {id, rows, dir: "auto"}) : el("input", {id, type, dir: "auto"});
    return {
        name,
        element: el("div", {class: `field ${width}`}, el("label", {for: id}, label), input),
        get: () => input.value,
        set: (value) => { input.value = value; },
    };
}

export function checkField(name, label) {
    const input = el("input", {type: "checkbox"});
    return {
        name,
        element: el("label", {class: "check"}, input, label),
        get: () => input.checked,
        set: (value) => { input.checked = value; },
    };
}

// {allDay, start, end}: dates or wall times; the end of an all-day event is its last day.
export function spanField(name) {
    const ids = [nextId(), nextId()];
    const allDay = el("input", {type: "checkbox"});
    const start = el("input", {id: ids[0]});
    const end = el("input", {id: ids[1]});
    let lastStart = "";
    const setTypes = () => {
        for (const input of [start, end]) {
            input.type = allDay.checked ? "date" : "datetime-local";
            input.step = "any";
        }
    };
    allDay.addEventListener("change", () => {
        const [from, to] = [start.value, end.value];
        setTypes();
        start.value = allDay.checked ? from.slice(0, 10) : from && `${from}T09:00`;
        end.value = allDay.checked ? to.slice(0, 10) : to && `${to}T10:00`;
        lastStart = start.value;
    });
    // Whoever moves the start moves the event.
    start.addEventListener("change", () => {
        if (start.value && lastStart && end.value) {
            end.value = moveWall(end.value, between(lastStart, start.value));
        }
        if (start.value) lastStart = start.value;
    });
    return {
        name,
        element: el("fieldset", {}, el("legend", {}, "When"),
            el("label", {class: "check"}, allDay, "All day"),
            el("div", {class: "pair"},
                el("div", {class: "field"}, el("label", {for: ids[0]}, "Start"), start),
                el("div", {class: "field"}, el("label", {for: ids[1]}, "End"), end))),
        get: () => ({allDay: allDay.checked, start: start.value, end: end.value}),
        set: (value) => {
            allDay.checked = value.allDay;
            setTypes();
            start.value = lastStart = value.start;
            end.value = value.end;
        },
    };
}
export const lastDayOf = (end) => moveDays(end, -1);
export const endOf = (lastDay) => moveDays(lastDay, 1);

const OWN_LABEL = "label:";

// A list of texts with a type each: [{type: "rel:..." or "label:...", text, of}], where `of` is what the provider has.
export function typedListField(name, label, {inputType, types, one}) {
    const rows = el("ul", {class: "typed"});
    const addRow = (value) => {
        const known = types.some(([type]) => type === value.type);
        const isOwn = value.type.startsWith(OWN_LABEL);
        const own = el("input", {type: "text", dir: "auto", "aria-label": `Own label of the ${one}`,
            placeholder: "Label", value: isOwn ? value.type.slice(OWN_LABEL.length) : "", hidden: !isOwn});
        const type = el("select", {"aria-label": `Type of the ${one}`, onchange: () => {
            own.hidden = type.value !== OWN_LABEL;
            if (!own.hidden) own.focus();
        }}, ...types.map(([key, text]) => el("option", {value: key}, text)),
        ...(known || isOwn ? [] : [el("option", {value: value.type}, value.type.replace(/^.*[#:]/, "") || "none")]),
        el("option", {value: OWN_LABEL}, "own label …"));
        type.value = isOwn ? OWN_LABEL : value.type;
        const text = el("input", {type: inputType, dir: "auto", "aria-label": one, value: value.text});
        const row = el("li", {}, type, own, text, el("button", {type: "button", "aria-label": `Remove this ${one}`,
            onclick: () => {
                row.remove();
                add.focus();
            }}, "Remove"));
        row.read = () => ({type: type.value === OWN_LABEL ? OWN_LABEL + own.value : type.value, text: text.value,
            of: value.of});
        rows.append(row);
        return text;
    };
    const add = el("button", {type: "button", onclick: () => addRow({type: types[0][0], text: "", of: {}}).focus()},
        `Add ${one}`);
    return {
        name,
        element: el("fieldset", {}, el("legend", {}, label), rows, add),
        get: () => [...rows.children].map((row) => row.read()).filter((value) => value.text.trim() !== ""),
        set: (values) => {
            rows.replaceChildren();
            values.forEach(addRow);
        },
    };
}

// A set of ids, of these options {id, label}; ids that are no option stay.
export function checksField(name, label, options) {
    const boxes = options.map((option) => el("input", {type: "checkbox", value: option.id}));
    let others = [];
    return {
        name,
        element: el("fieldset", {}, el("legend", {}, label), el("div", {class: "checks"}, ...options.map((option, i) =>
            el("label", {class: "check"}, boxes[i], data(option.label))))),
        get: () => [...boxes.filter((box) => box.checked).map((box) => box.value), ...others],
        set: (ids) => {
            others = ids.filter((id) => !options.some((option) => option.id === id));
            for (const box of boxes) box.checked = ids.includes(box.value);
        },
    };
}

// A picture: {address of the provider's, chosen file's name, removed}. `file()` is the chosen file.
export function photoField(name, label) {
    const id = nextId();
    const picture = el("img", {class: "avatar large", alt: ""});
    const file = el("input", {id, type: "file", accept: "image/*"});
    const drop = el("button", {type: "button"}, "Remove photo");
    let address = "";
    let isRemoved = false;
    let preview = "";
    const show = () => {
        if (preview) URL.revokeObjectURL(preview);
        preview = file.files[0] ? URL.createObjectURL(file.files[0]) : "";
        const source = preview || (isRemoved ? "" : address);
        picture.hidden = source === "";
        drop.hidden = source === "";
        if (source) picture.src = source;
    };
    file.addEventListener("change", () => {
        isRemoved = false;
        show();
    });
    drop.addEventListener("click", () => {
        file.value = "";
        isRemoved = address !== "";
        show();
        file.focus();
    });
    byId("editor").addEventListener("close", () => {
        file.value = "";
        show();
    }, {once: true});
    return {
        name,
        element: el("div", {class: "field photo"}, picture, el("div", {}, el("label", {for: id}, label), file, drop)),
        get: () => ({address, chosen: file.files[0]?.name ?? "", isRemoved, file: file.files[0]}),
        set: (value) => {
            address = value.address;
            isRemoved = false;
            show();
        },
    };
}

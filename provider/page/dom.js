// Building elements. Whatever comes from the provider goes in as text or as the value of an attribute, never as HTML.

export const byId = (id) => document.getElementById(id);

// el("button", {class: "row", onclick: open}, "Text", otherElement). Properties that only exist on the object, like
// value and checked, are set there; null and false leave an attribute out.
export function el(name, attributes = {}, ...children) {
    const element = document.createElement(name);
    for (const [key, value] of Object.entries(attributes)) {
        if (key.startsWith("on")) {
            element.addEventListener(key.slice(2), value);
        } else if (key === "value" || key === "checked" || key === "disabled" || key === "hidden") {
            element[key] = value;
        } else if (value !== null && value !== undefined && value !== false) {
            element.setAttribute(key, value === true ? "" : value);
        }
    }
    element.append(...children.filter((child) => child !== null && child !== undefined));
    return element;
}

// Text of others, which keeps its own direction and does not turn its surroundings round.
export const data = (text, name = "span", attributes = {}) => el(name, {dir: "auto", ...attributes}, text);

export const badge = (text, kind = "", title = null) => el("span", {class: `badge ${kind}`, title}, text);

let toastEnds = 0;
export function toast(text) {
    byId("toast").textContent = text;
    clearTimeout(toastEnds);
    toastEnds = setTimeout(() => { byId("toast").textContent = ""; }, 4000);
}

// The colour in which the element's style sheet rules paint it; empty: none.
export function setColor(element, color) {
    element.classList.toggle("has-color", Boolean(color));
    element.style.setProperty("--color", color ?? "");
}

const said = new WeakMap();
// Whether the element is to show something else than when this was asked last. Elements that go on saying the same
// stay, so that a look at the provider takes no focus away.
export function isNews(element, content) {
    const text = JSON.stringify(content);
    const isNew = said.get(element) !== text;
    said.set(element, text);
    return isNew;
}

// A row of radio buttons; `options` are {id, label, color, note}.
export function showChoice(root, name, options, chosen, choose) {
    if (!isNews(root, [options, chosen])) return;
    const hadFocus = root.contains(document.activeElement);
    root.replaceChildren(...options.map((option) => {
        const chip = el("label", {class: "chip"},
            el("input", {type: "radio", name, value: option.id, checked: option.id === chosen,
                onchange: () => choose(option.id)}),
            data(option.label),
            option.note ? el("span", {class: "quiet"}, option.note) : null);
        setColor(chip, option.color);
        return chip;
    }));
    if (hadFocus) root.querySelector("input:checked")?.focus();
}

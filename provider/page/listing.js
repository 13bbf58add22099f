// Listing: one page of a list that may be long, with a filter, an order and a pager. The provider filters and sorts.
import {call} from "./api.js";
import {el} from "./dom.js";

const PAGE_SIZE = 50;
const TYPING_PAUSE_MS = 250;

export class Listing {
    // `path()`: the list's address, or null when there is none; `row(item, reply)`: an element or more for an item;
    // `noun`: what one and many items are called; `placeOrder`: what the natural order is called. What else a row
    // depends on stands in `context`.
    constructor(root, {path, row, noun, placeOrder}) {
        this.path = path;
        this.row = row;
        this.noun = noun;
        this.context = "";
        this.offset = 0;
        this.asked = 0;
        this.shown = new Map();
        this.shownPath = null;
        this.filter = el("input", {type: "search", "aria-label": `Find ${noun[1]}`, placeholder: "Find …",
            oninput: () => this.#typed()});
        this.order = el("select", {"aria-label": "Order", onchange: () => this.#look(0)},
            el("option", {value: "changed"}, "Last changed first"), el("option", {value: "place"}, placeOrder));
        this.count = el("p", {class: "count quiet", role: "status"});
        this.list = el("ul", {class: "rows"});
        this.previous = el("button", {type: "button", onclick: () => this.#turn(-1)}, "Previous");
        this.next = el("button", {type: "button", onclick: () => this.#turn(1)}, "Next");
        this.pager = el("div", {class: "pager"}, this.previous, this.next);
        root.append(el("div", {class: "tools"}, this.filter, this.order), this.count, this.list, this.pager);
    }

    #typed() {
        clearTimeout(this.typing);
        this.typing = setTimeout(() => this.#look(0), TYPING_PAUSE_MS);
    }
    // Without an answer the list stays as it is; the page tells of a lost connection and looks again.
    #look(offset) {
        this.offset = offset;
        return this.refresh().catch(console.error);
    }
    async #turn(pages) {
        await this.#look(Math.max(0, this.offset + pages * PAGE_SIZE));
        this.list.scrollIntoView({block: "nearest"});
    }

    // Only the answer to the newest question is shown.
    async refresh() {
        const path = this.path();
        if (path !== this.shownPath) this.offset = 0;
        this.shownPath = path;
        const question = ++this.asked;
        if (path === null) {
            this.#show({total: 0, matching: 0, items: []}, "");
            return;
        }
        const query = new URLSearchParams({limit: PAGE_SIZE, offset: this.offset, order: this.order.value,
            q: this.filter.value});
        const address = `${path}?${query}`;
        const reply = await call("GET", address);
        if (question !== this.asked) return;
        if (reply.items.length === 0 && reply.matching > 0) {
            this.offset = Math.floor((reply.matching - 1) / PAGE_SIZE) * PAGE_SIZE;
            await this.refresh();
            return;
        }
        this.#show(reply, address);
    }

    // A row is made again only when its item is another one, so that focus and pictures stay. What is new since the
    // same question was asked last is marked.
    #show(reply, address) {
        const isSameList = address === this.shownAddress;
        const active = document.activeElement;
        const focused = this.list.contains(active) ? active.closest("li").dataset.id : null;
        const before = this.shown;
        this.shown = new Map();
        for (const item of reply.items) {
            const said = JSON.stringify([address.split("?")[0], item, reply.series?.[item.recurringEventId],
                this.context]);
            const known = before.get(item.id);
            if (known?.said === said) {
                this.shown.set(item.id, known);
                continue;
            }
            const element = el("li", {"data-id": item.id}, ...[this.row(item, reply)].flat());
            if (isSameList) element.classList.add("fresh");
            this.shown.set(item.id, {said, element});
        }
        this.shownAddress = address;
        const elements = [...this.shown.values()].map((row) => row.element);
        const isSame = elements.length === this.list.children.length &&
            elements.every((element, i) => element === this.list.children[i]);
        if (!isSame) {
            this.list.replaceChildren(...elements);
            if (focused !== null) {
                elements.find((element) => element.dataset.id === focused)?.querySelector(active.tagName)?.focus();
            }
        }
        this.#tell(reply);
    }

    #tell({total, matching, items}) {
        const named = (count) => `${count.toLocaleString("en")} ${this.noun[count === 1 ? 0 : 1]}`;
        const isFiltered = this.filter.value.trim() !== "";
        const of = isFiltered ? `${matching.toLocaleString("en")} found of ${named(total)}` : named(total);
        const isPaged = matching > items.length;
        const range = `${(this.offset + 1).toLocaleString("en")}–` +
            `${(this.offset + items.length).toLocaleString("en")}`;
        const text = total === 0 ? `No ${this.noun[1]} here.` : isPaged ? `${range} of ${of}` : of;
        if (this.count.textContent !== text) this.count.textContent = text;
        this.pager.hidden = !isPaged;
        this.previous.disabled = this.offset === 0;
        this.next.disabled = this.offset + items.length >= matching;
    }
}

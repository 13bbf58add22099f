// Contacts and groups of the account, the list of the contacts, and the forms of both.
import {accountPath, call} from "./api.js";
import {badge, byId, data, el, isNews} from "./dom.js";
import {edit} from "./editor.js";
import {checksField, photoField, textField, typedListField} from "./fields.js";
import {Listing} from "./listing.js";

const REL = "http://schemas.provider.example/g/2005#";
const typesOf = (words) => words.map((word) => [`rel:${REL}${word}`, word.replace("_", " ")]);
const NAME_PARTS = [["first", "gd$givenName", "First name", "half"], ["last", "gd$familyName", "Last name", "half"],
    ["prefix", "gd$namePrefix", "Prefix", "third"], ["middle", "gd$additionalName", "Middle name", "third"],
    ["suffix", "gd$nameSuffix", "Suffix", "third"]];
// In the order in which a whole name is said.
const SAID_PARTS = ["prefix", "first", "middle", "last", "suffix"];
// Lists of elements with a type: the member, where its text is, and how the form shows it.
const LISTS = [
    {name: "emails", member: "gd$email", text: "address", label: "E-mail", one: "e-mail address", inputType: "email",
        types: typesOf(["home", "work", "mobile", "other"])},
    {name: "phones", member: "gd$phoneNumber", text: "$t", label: "Phone", one: "phone number", inputType: "tel",
        types: typesOf(["mobile", "home", "work", "main", "home_fax", "work_fax", "pager", "other"])},
];
const MEMBERSHIPS = "gContact$groupMembershipInfo";
const OWN_CONTACTS = "6";  // the group of those whom the user put into the address book

let account = "";
let groups = [];
let listing = null;

const lastSegment = (address) => decodeURIComponent(address.slice(address.lastIndexOf("/") + 1));
const isSystem = (group) => "gContact$systemGroup" in group;
const groupName = (group) => (group.title?.$t ?? "").replace(/^System Group: /, "");
const groupsOf = (contact) => (contact[MEMBERSHIPS] ?? []).map(({href}) => lastSegment(href));
const photoPath = (contact) => `${accountPath(account, "contacts", contact.id)}/photo`;
const firstOf = (contact, {member, text}) => contact[member]?.[0]?.[text] ?? "";
const titleOf = (contact) => contact.title?.$t || LISTS.map((list) => firstOf(contact, list)).find(Boolean) || "";

const typeOf = (element) => element.label ? `label:${element.label}` : `rel:${element.rel ?? ""}`;

// What the provider has of an element stays, but for its text and its type.
function elementOf({type, text, of}, list) {
    const element = {...of, [list.text]: text.trim()};
    if (type === typeOf(of)) return element;
    delete element.rel;
    delete element.label;
    const [kind, word] = [type.slice(0, type.indexOf(":")), type.slice(type.indexOf(":") + 1)];
    element[word ? kind : "rel"] = word || `${REL}other`;
    return element;
}

function nameBody(values, base, contact) {
    const changed = NAME_PARTS.filter(([part]) => values[part] !== base[part]);
    if (changed.length === 0) return {};
    const before = contact?.gd$name ?? {};
    const name = {};
    for (const [part, member] of changed) {
        const hasMore = Object.keys(before[member] ?? {}).some((key) => key !== "$t");
        name[member] = values[part] || hasMore ? {$t: values[part] || null} : null;
    }
    // The name in one piece would go on saying the old one.
    if (before.gd$fullName) {
        name.gd$fullName = {$t: SAID_PARTS.map((part) => values[part]).filter(Boolean).join(" ") || null};
    }
    return {gd$name: name};
}

function membershipsBody(values, base, contact) {
    if (JSON.stringify(values.groups) === JSON.stringify(base.groups)) return {};
    const before = contact?.[MEMBERSHIPS] ?? [];
    const memberships = values.groups.map((id) => before.find(({href}) => lastSegment(href) === id) ??
        {href: `/m8/feeds/groups/default/base/${encodeURIComponent(id)}`, deleted: "false"});
    return {[MEMBERSHIPS]: memberships.length > 0 ? memberships : null};
}

const contactKind = {
    name: "contact",
    title: titleOf,
    fields: () => [
        photoField("photo", "Photo"),
        ...NAME_PARTS.map(([name, , label, width]) => textField(name, label, {width})),
        ...LISTS.map((list) => typedListField(list.name, list.label, list)),
        textField("note", "Note", {rows: 3}),
        checksField("groups", "Groups", groups.map((group) => ({id: group.id, label: groupName(group)}))),
    ],
    values(contact) {
        const values = {
            photo: {address: contact?.photo ? addressOfPhoto(contact) : ""},
            note: contact?.content?.$t ?? "",
            groups: contact ? groupsOf(contact) : [OWN_CONTACTS],
        };
        for (const [part, member] of NAME_PARTS) values[part] = contact?.gd$name?.[member]?.$t ?? "";
        for (const {name, member, text} of LISTS) {
            values[name] = (contact?.[member] ?? []).map((of) => ({type: typeOf(of), text: of[text] ?? "", of}));
        }
        return values;
    },
    fault(values) {
        const needed = [...NAME_PARTS.map(([part]) => part), ...LISTS.map(({name}) => name)];
        const isEmpty = needed.every((name) => values[name].length === 0);
        return isEmpty ? "A name, an e-mail address or a phone number is needed." : "";
    },
    body(values, base, contact) {
        const body = {...nameBody(values, base, contact), ...membershipsBody(values, contact ? base : {}, contact)};
        for (const list of LISTS) {
            if (JSON.stringify(values[list.name]) === JSON.stringify(base[list.name])) continue;
            const elements = values[list.name].map((value) => elementOf(value, list));
            body[list.member] = elements.length > 0 ? elements : null;
        }
        if (values.note !== base.note) body.content = values.note ? {$t: values.note} : null;
        return body;
    },
    deletes: () => "Delete",
    async after(path, {photo}) {
        if (photo.file) await call("PUT", `${path}/photo`, {file: photo.file});
        else if (photo.isRemoved) await call("DELETE", `${path}/photo`);
    },
};

const groupKind = {
    name: "group",
    title: groupName,
    fields: () => [textField("title", "Name")],
    values: (group) => ({title: group?.title?.$t ?? ""}),
    fault: ({title}) => title.trim() ? "" : "A name is needed.",
    body: (values, base) => values.title === base.title ? {} : {title: {$t: values.title}},
    deletes: () => "Delete",
    note: (group) => group ? "Who is in a group that is deleted stays, without it." : "",
};

// The etag is in it so that a browser does not show the picture before.
const addressOfPhoto = (contact) => `${photoPath(contact)}?etag=${encodeURIComponent(contact.photo)}`;

function avatar(contact) {
    if (contact.photo) return el("img", {class: "avatar", alt: "", loading: "lazy", src: addressOfPhoto(contact)});
    const initials = titleOf(contact).split(/\s+/).filter(Boolean).map((word) => [...word][0]);
    return el("span", {class: "avatar", "aria-hidden": "true"}, initials.slice(0, 2).join("").toUpperCase() || "?");
}

function row(contact) {
    const lines = LISTS.map((list) => firstOf(contact, list)).filter(Boolean);
    const names = groupsOf(contact).map((id) => groups.find((group) => group.id === id)).filter(Boolean).map(groupName);
    const open = () => edit(contactKind, contactsPath(), contact);
    return el("button", {type: "button", class: "row contact", onclick: open},
        avatar(contact),
        el("span", {class: "lines"},
            data(titleOf(contact) || "(no name)", "strong"),
            lines.length > 0 ? el("span", {class: "meta"}, ...lines.map((line) => data(line))) : null,
            names.length > 0 ? el("span", {class: "badges"}, ...names.map((name) => badge(name))) : null));
}

function groupRow(group) {
    if (isSystem(group)) return el("li", {}, data(groupName(group), "span", {class: "chip is-fixed"}));
    return el("li", {}, data(groupName(group), "button", {type: "button", class: "chip",
        onclick: () => edit(groupKind, groupsPath(), group)}));
}

const contactsPath = () => account && accountPath(account, "contacts");
const groupsPath = () => accountPath(account, "groups");

export function setUpContacts() {
    listing = new Listing(byId("contacts").querySelector(".listing"),
        {path: contactsPath, row, noun: ["contact", "contacts"], placeOrder: "By name"});
    byId("add-contact").addEventListener("click", () => edit(contactKind, contactsPath(), null));
    byId("add-group").addEventListener("click", () => edit(groupKind, groupsPath(), null));
}

export async function showContacts(email) {
    const {items} = await call("GET", accountPath(email, "groups"));
    account = email;
    groups = items.filter((group) => !group.deleted);
    if (isNews(byId("groups"), groups)) byId("groups").replaceChildren(...groups.map(groupRow));
    listing.context = groups;  // a row shows their names
    await listing.refresh();
}

// The page of the provider: which account and view are shown, and keeping them as the provider has them.
import {call, watchNews} from "./api.js";
import {byId, data, isNews} from "./dom.js";
import {setUpContacts, showContacts} from "./contacts.js";
import {setUpEditor} from "./editor.js";
import {setUpEvents, showEvents} from "./events.js";
import {clearRequests, showRequests} from "./requests.js";
import {setUpTasks, showTasks} from "./tasks.js";

const VIEWS = {events: showEvents, tasks: showTasks, contacts: showContacts};
// The requests stand beside the events where there is room.
const shownView = () => VIEWS[location.hash.slice(1)] ?? showEvents;

let changes = -1;

function tellConnection(state, text) {
    const line = byId("connection");
    if (line.dataset.state === state) return;
    line.dataset.state = state;
    line.textContent = text;
}

async function showAccounts() {
    const {accounts} = await call("GET", "/admin/accounts");
    const select = byId("account");
    if (!isNews(select, accounts.map(({email, name}) => [email, name]))) return;
    const chosen = select.value;
    select.replaceChildren(...accounts.map(({email, name}) =>
        data(name ? `${name} (${email})` : email, "option", {value: email})));
    if (accounts.some(({email}) => email === chosen)) select.value = chosen;
}

async function showAll() {
    await showAccounts();
    const email = byId("account").value;
    if (email) await shownView()(email);
}

function showView() {
    const view = location.hash.slice(1);
    document.body.dataset.view = view in VIEWS || view === "requests" ? view : "events";
    for (const link of document.querySelectorAll("nav a")) {
        const isShown = link.hash === `#${document.body.dataset.view}`;
        if (isShown) link.setAttribute("aria-current", "page");
        else link.removeAttribute("aria-current");
    }
    return showAll();
}

// A failure leaves the count as it was, so that the next news tries again.
async function heard(news, isNewRun) {
    if (isNewRun) clearRequests();
    showRequests(news.requests, news.last, isNewRun);
    if (isNewRun || news.changes !== changes) await showAll();
    changes = news.changes;
    tellConnection("live", "Live");
}

function lost() {
    changes = -1;
    tellConnection("lost", "Connection lost – trying again");
}

setUpEditor(showAll);
setUpEvents();
setUpTasks();
setUpContacts();
byId("clear-requests").addEventListener("click", clearRequests);
byId("account").addEventListener("change", () => showAll().catch(lost));
window.addEventListener("hashchange", () => showView().catch(lost));
showView().catch(lost);
watchNews(heard, lost);

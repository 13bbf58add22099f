// What the test drives: a provider, a device with the daemon, and the page in a browser.
import {execFileSync, spawn} from "node:child_process";
import {rmSync, writeFileSync} from "node:fs";
import {createInterface} from "node:readline";
import {chromium} from "playwright-core";

const ROOT = process.env.VANTOR_PIM_SYNC_ROOT;
const BIN = process.env.VPS_BIN;
if (!ROOT || !BIN) throw new Error("start this with scripts/test-page");

export class Provider {
    // Its content outlives a restart in a state file named after it.
    constructor(name, seed) {
        this.name = name;
        this.seed = seed;
        this.port = "0";
    }
    async start() {
        const args = ["--quiet", "--port", this.port, "--seed", this.seed, "--state", `${ROOT}/${this.name}.state`];
        this.process = spawn(`${BIN}/vantor-pim-provider`, args, {stdio: ["ignore", "pipe", "inherit"]});
        // Only as long as it runs: another process may get the number afterwards.
        const pidFile = `${ROOT}/${this.name}.pid`;
        writeFileSync(pidFile, String(this.process.pid));
        this.ended = new Promise((resolve) => {
            this.process.once("exit", (status) => {
                rmSync(pidFile, {force: true});
                resolve(status);
            });
        });
        for await (const line of createInterface({input: this.process.stdout})) {
            this.ready = JSON.parse(line);
            break;
        }
        this.url = this.ready.url;
        this.port = new URL(this.url).port;
    }
    // Resolves to its exit status.
    stop() {
        this.process.kill("SIGTERM");
        return this.ended;
    }
    async admin(method, path, body) {
        const response = await fetch(`${this.url}/admin${path}`, {method, body: body && JSON.stringify(body),
            headers: body ? {"Content-Type": "application/json"} : {}});
        if (!response.ok) throw new Error(`${method} ${path}: ${await response.text()}`);
        return response.json();
    }
}

// The command-line tool; `input` goes to its standard input.
export const tool = (args, input = "") =>
    execFileSync(`${BIN}/vantor-pim-syncctl`, args, {input, encoding: "utf8", stdio: ["pipe", "pipe", "pipe"]});
export const listed = (what) => JSON.parse(tool([what, "list", "--json"]));
export const sync = () => tool(["sync", "1", "all", "--wait"]);

export function makeDevice(provider) {
    const [account] = provider.ready.accounts;
    tool(["init"]);
    tool(["key", "set", "vantor.tovik.client.id"], provider.ready.clientId);
    tool(["key", "set", "vantor.tovik.client.secret"], provider.ready.clientSecret);
    tool(["account", "add", "--id", "1", "--email", account.email, "--server", provider.url,
        "--refresh-token-file", "-"], account.refreshToken);
    sync();
    return account;
}

export function openBrowser() {
    const args = process.getuid() === 0 ? ["--no-sandbox"] : [];
    return chromium.launch({executablePath: "/usr/bin/chromium", args});
}

// Waits for what `look` finds on a side that has no events to wait for.
export async function eventually(look, limitMs = 15_000) {
    for (const end = Date.now() + limitMs; ;) {
        const found = await look();
        if (found || Date.now() > end) return found;
        await new Promise((resolve) => { setTimeout(resolve, 50); });
    }
}

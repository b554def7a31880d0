// An application that one of Debian's web servers puts behind a link, and nothing of which knows that
// a browser comes.
import { spawn } from "node:child_process";
import { once } from "node:events";
import { fileURLToPath } from "node:url";
import { createInterface } from "node:readline";

const program = fileURLToPath(new URL("guarded_site.py", import.meta.url));
const build = process.env.BUILD_DIR;

export class GuardedSite {
  static async start(webServer) {
    const site = new GuardedSite();
    const environment = { VELK_BUILD: build, VELK_ROOT: `${build}/root`, PYTHONDONTWRITEBYTECODE: "1" };
    site.#process = spawn("python3", [program, webServer], {
      env: { ...process.env, ...environment },
      stdio: ["pipe", "pipe", "inherit"],
    });
    const lines = createInterface({ input: site.#process.stdout })[Symbol.asyncIterator]();
    site.address = (await lines.next()).value;
    site.secret = (await lines.next()).value;
    if (!site.secret) throw new Error(`${webServer} does not run`);
    return site;
  }

  #process;

  async end() {
    const gone = once(this.#process, "exit");
    this.#process.stdin.end();
    await gone;
  }
}

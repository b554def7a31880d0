// A running velksharing-web with its own database, accounts that exist in it alone, and a folder
// to share.
import { execFileSync, spawn } from "node:child_process";
import { chmodSync, chownSync, mkdirSync, mkdtempSync, readdirSync, rmSync } from "node:fs";
import { readFileSync, utimesSync, writeFileSync } from "node:fs";
import { tmpdir } from "node:os";
import { join } from "node:path";
import { paint, print, tone } from "./pictures.mjs";

const build = process.env.BUILD_DIR;
const isRoot = process.getuid() === 0;
const ann = 2001;
const summer = new Date("2026-08-02T16:20:00Z");

export const passwords = { link: "open sesame", bob: "bobs password" };

export class World {
  static async make(browser) {
    const world = new World();
    try {
      world.#writeAccounts();
      await world.#writeFiles(browser);
      world.#emptyDatabase();
      await world.#start();
    } catch (error) {
      await world.end();
      throw error;
    }
    return world;
  }

  #folder = mkdtempSync(join(tmpdir(), "velk-browser-"));
  #server;
  #origin;
  #environment;

  get shared() {
    return join(this.#folder, "holiday");
  }

  get files() {
    return ["read me.txt", "Tickets.pdf", "Waves.wav", "Beach.png"];
  }

  // Makes a link, and tells the address at which visitors reach it.
  share(...options) {
    const hash = this.#run("link", "create", "--project", "files", "--owner", "ann", ...options);
    return `${this.#origin}/sharing/${hash.trim()}`;
  }

  shareWithPassword(...options) {
    return this.share(
      ...["--path", this.shared, "--title", "Our holiday on the coast"],
      ...["--password-file", join(this.#folder, "password"), ...options],
    );
  }

  // A folder of many empty files, to be shared.
  makeManyFiles(count) {
    const folder = join(this.#folder, "many");
    mkdirSync(folder);
    for (let i = 1; i <= count; ++i) writeFileSync(join(folder, `${i}.txt`), "");
    return folder;
  }

  address(path) {
    return this.#origin + path;
  }

  async end() {
    if (this.#server?.exitCode === null) {
      const gone = new Promise((resolve) => this.#server.once("exit", resolve));
      this.#server.kill("SIGTERM");
      await gone;
    }
    this.#removeWrapperFolders();
    rmSync(this.#folder, { recursive: true, force: true });
  }

  // The wrapper of PAM cleans up when a program returns from main(), which a worker does not.
  #removeWrapperFolders() {
    for (const name of readdirSync("/tmp").filter((found) => found.startsWith("pam."))) {
      const folder = join("/tmp", name);
      if (this.#isOurs(join(folder, "velk"))) rmSync(folder, { recursive: true, force: true });
    }
  }

  #isOurs(service) {
    try {
      return readFileSync(service, "utf8").includes(this.#folder);
    } catch {
      return false;
    }
  }

  #writeAccounts() {
    const inFolder = (name) => join(this.#folder, name);
    const matrix = readdirSync("/usr/lib")
      .map((name) => `/usr/lib/${name}/pam_wrapper`)
      .find((path) => {
        try {
          return readdirSync(path).includes("pam_matrix.so");
        } catch {
          return false;
        }
      });
    const me = isRoot ? "" : `builder:x:${process.getuid()}:${process.getgid()}::/:/bin/sh\n`;
    writeFileSync(
      inFolder("passwd"),
      `root:x:0:0::/:/bin/sh\nann:x:${ann}:${ann}::/:/bin/sh\nbob:x:2002:2002::/:/bin/sh\n${me}`,
    );
    writeFileSync(inFolder("group"), `root:x:0:\nann:x:${ann}:\nbob:x:2002:\n`);
    writeFileSync(inFolder("passwords"), `bob:${passwords.bob}:velk\n`, { mode: 0o600 });
    writeFileSync(inFolder("password"), `${passwords.link}\n`, { mode: 0o600 });
    mkdirSync(inFolder("pam.d"));
    const module = `required ${matrix}/pam_matrix.so passdb=${inFolder("passwords")}`;
    writeFileSync(inFolder("pam.d/velk"), `auth ${module}\naccount ${module}\n`);
    writeFileSync(
      inFolder("pam.d/other"),
      "auth required pam_deny.so\naccount required pam_deny.so\n",
    );
    this.#environment = {
      ...process.env,
      TZ: "UTC",
      LD_PRELOAD: "libnss_wrapper.so libpam_wrapper.so",
      NSS_WRAPPER_PASSWD: inFolder("passwd"),
      NSS_WRAPPER_GROUP: inFolder("group"),
      PAM_WRAPPER: "1",
      PAM_WRAPPER_SERVICE_DIR: inFolder("pam.d"),
    };
  }

  async #writeFiles(browser) {
    mkdirSync(join(this.shared, "letters"), { recursive: true });
    const files = {
      ...(await paint(browser)),
      "Tickets.pdf": await print(browser),
      "Waves.wav": tone(),
      "read me.txt": "Where we were\n\n  1. the sea\n  2. the hills & <the harbour>\n",
      "letters/To all.txt": "Dear all,\n\nhere are the pictures of our holiday.\n\nAnn\n",
      "letters/a_rather_long_name_that_nobody_wanted_to_shorten_and_that_has_no_blanks.bin": "?",
    };
    for (const [name, bytes] of Object.entries(files)) {
      writeFileSync(join(this.shared, name), bytes);
      utimesSync(join(this.shared, name), summer, summer);
    }
    utimesSync(join(this.shared, "letters"), summer, summer);
    // The worker opens what is shared as its owner.
    chmodSync(this.#folder, 0o711);
    if (isRoot) {
      for (const name of ["", "letters", ...Object.keys(files)]) {
        chownSync(join(this.shared, name), ann, ann);
      }
    }
  }

  // The root of a build folder belongs to its tests.
  #emptyDatabase() {
    const folder = join(build, "root/etc/private");
    for (const database of ["session/sharing.db", "autoblock.db"]) {
      for (const suffix of ["", "-wal", "-shm", "-journal"]) {
        rmSync(join(folder, database + suffix), { force: true });
      }
    }
  }

  #run(...words) {
    return execFileSync(join(build, "bin/velksharing"), words, {
      env: this.#environment,
      encoding: "utf8",
    });
  }

  // The program tells its port once it serves.
  #start() {
    const nowhere = join(this.#folder, "no.conf");
    const words = ["--listen", "127.0.0.1:0", "--workers", "2", "--config", nowhere];
    this.#server = spawn(join(build, "bin/velksharing-web"), [...words, "--access-log", "off"], {
      env: this.#environment,
      stdio: ["ignore", "ignore", "pipe"],
    });
    return new Promise((resolve, reject) => {
      let said = "";
      this.#server.once("error", reject);
      this.#server.once("exit", () => reject(new Error(`velksharing-web ended: ${said}`)));
      this.#server.stderr.setEncoding("utf8").on("data", (text) => {
        said += text;
        const port = /HTTP on 127\.0\.0\.1:(\d+)/.exec(said);
        if (!port) return;
        this.#origin = `http://127.0.0.1:${port[1]}`;
        resolve();
      });
    });
  }
}

// Visits to the running program, from the first page to logging out.
import assert from "node:assert/strict";
import { readFileSync } from "node:fs";
import { createServer } from "node:http";
import { join } from "node:path";
import { after, before, describe, it } from "node:test";
import { expectAccessible, expectNoOverflow, launch, newPage } from "./support/browser.mjs";
import { phones, watchConsole } from "./support/browser.mjs";
import { World, passwords } from "./support/world.mjs";

let browser, world;
before(async () => {
  browser = await launch();
  world = await World.make(browser);
});
after(async () => {
  await world?.end();
  await browser?.close();
});

// A visitor of its own for each test.
function visit(name, walk, options = {}) {
  it(name, async () => {
    const page = await newPage(browser, options);
    const complaints = watchConsole(page);
    await walk(page);
    // The browser reports pages with an error status, which is what they are.
    const unexpected = complaints.filter((text) => !text.includes("status of 4"));
    assert.deepEqual(unexpected, []);
    await page.context().close();
  });
}

const withoutScript = { javaScriptEnabled: false };
const heading = (page) => page.locator("h1").innerText();

// Clicks, and waits for the page that the click leads to.
async function follow(control) {
  const [answer] = await Promise.all([control.page().waitForNavigation(), control.click()]);
  return answer;
}

async function enter(page, address) {
  await page.goto(address);
  await page.getByLabel("Password").fill(passwords.link);
  await follow(page.getByRole("button", { name: "Open" }));
}

async function downloadBy(page, control) {
  const [download] = await Promise.all([page.waitForEvent("download"), control.click()]);
  return { name: download.suggestedFilename(), bytes: readFileSync(await download.path()) };
}

// The names in a ZIP's own list of contents.
function namesInZip(bytes) {
  const names = [];
  const entry = Buffer.from("PK\x01\x02", "latin1");
  for (let at = bytes.indexOf(entry); at >= 0; at = bytes.indexOf(entry, at + 1)) {
    names.push(bytes.toString("utf8", at + 46, at + 46 + bytes.readUInt16LE(at + 28)));
  }
  return names.sort();
}

describe("a link with a password", () => {
  let address;
  before(() => {
    address = world.shareWithPassword();
  });

  visit(
    "lets nobody in with a wrong one",
    async (page) => {
      await page.goto(address);
      assert.equal(await heading(page), "Our holiday on the coast");
      await page.getByLabel("Password").fill("open barley");
      const answer = await follow(page.getByRole("button", { name: "Open" }));
      assert.equal(answer.status(), 401);
      assert.match(await page.getByRole("alert").innerText(), /did not work/);
      assert.equal(await page.getByLabel("Password").inputValue(), "");
      assert.equal(await page.getByRole("table").count(), 0);
    },
    withoutScript,
  );

  visit(
    "lets the visitor look, download and leave",
    async (page) => {
      await enter(page, address);
      assert.equal(page.url(), address);
      assert.equal(await heading(page), "Our holiday on the coast");
      assert.equal(await page.getByRole("heading", { name: "5 images" }).count(), 1);
      for (const image of await page.locator(".gallery img").all()) {
        await image.scrollIntoViewIfNeeded();
        await image.evaluate((element) => element.decode());
        assert.ok((await image.evaluate((element) => element.naturalWidth)) > 0);
      }

      const fetch = page.getByRole("link", { name: "Download Beach.png" });
      const picture = await downloadBy(page, fetch);
      assert.equal(picture.name, "Beach.png");
      assert.deepEqual(picture.bytes, readFileSync(join(world.shared, "Beach.png")));

      const all = await downloadBy(page, page.getByRole("link", { name: "Download all" }));
      assert.match(all.name, /\.zip$/);
      const names = namesInZip(all.bytes);
      for (const name of ["Beach.png", "letters/To all.txt", "read me.txt"]) {
        assert.ok(names.some((found) => found.endsWith(name)), `${name} in ${names}`);
      }

      await follow(page.getByRole("button", { name: "Log out" }));
      assert.equal(await heading(page), "You have logged out");
      await follow(page.getByRole("link", { name: "Open the link again" }));
      assert.equal(await page.getByLabel("Password").count(), 1);
      const picturePage = await page.goto(`${address}/Beach.png?view`);
      assert.match(picturePage.headers()["content-type"], /text\/html/);
    },
    withoutScript,
  );

  visit(
    "gives a selection as a ZIP",
    async (page) => {
      await enter(page, address);
      const button = page.getByRole("button", { name: "Download selection" });
      assert.ok(!(await button.isVisible()));
      await page.getByLabel("Select read me.txt").check();
      await page.getByLabel("Select letters").check();
      const names = namesInZip((await downloadBy(page, button)).bytes);
      assert.ok(names.some((name) => name.endsWith("read me.txt")));
      assert.ok(names.some((name) => name.endsWith("letters/To all.txt")));
      assert.ok(!names.some((name) => name.endsWith("Beach.png")));
    },
    withoutScript,
  );

  visit("shows what is in the files", async (page) => {
    await enter(page, address);
    const row = page.getByRole("row", { name: "Beach.png" });
    await follow(row.getByRole("link", { name: "Beach.png", exact: true }));
    const image = page.getByRole("img", { name: "Preview of Beach.png" });
    await image.evaluate((element) => element.decode());
    assert.equal(await image.evaluate((element) => element.naturalWidth), 800);

    await page.goto(`${address}/read%20me.txt`);
    const text = page.getByRole("region", { name: "Preview of read me.txt" });
    assert.match(await text.innerText(), /2\. the hills & <the harbour>/);

    await page.goto(`${address}/Waves.wav`);
    const audio = page.locator("audio");
    await page.waitForFunction((element) => element.readyState > 0, await audio.elementHandle());
    assert.equal(await audio.evaluate((element) => Math.round(element.duration)), 1);
  });

  visit("leads down into folders and back up", async (page) => {
    await enter(page, address);
    await follow(page.getByRole("link", { name: "letters (Folder)" }));
    assert.equal(await heading(page), "letters");
    await follow(page.getByRole("link", { name: "To all.txt", exact: true }));
    assert.equal(await heading(page), "To all.txt");
    const way = page.getByRole("navigation", { name: "Where you are" });
    await follow(way.getByRole("link", { name: "letters" }));
    assert.equal(await heading(page), "letters");
    await follow(way.getByRole("link", { name: "Our holiday on the coast" }));
    assert.equal(page.url(), address);
  });

  visit("sorts by a click on a column", async (page) => {
    await enter(page, address);
    const names = () => page.locator("td.name bdi").allInnerTexts();
    const column = (name) => page.getByRole("columnheader", { name });
    const [folder, ...files] = await names();
    assert.equal(await column("Name").getAttribute("aria-sort"), "ascending");

    await follow(column("Name").getByRole("link"));
    assert.equal(await column("Name").getAttribute("aria-sort"), "descending");
    assert.deepEqual(await names(), [folder, ...files.reverse()]);

    await follow(column("Size").getByRole("link"));
    assert.equal(await column("Size").getAttribute("aria-sort"), "descending");
    assert.equal(await column("Name").getAttribute("aria-sort"), null);
    assert.equal((await names()).at(-1), "read me.txt");
  });

  visit(
    "can be used with the keyboard alone",
    async (page) => {
      await page.goto(address);
      await page.keyboard.type(passwords.link);
      await Promise.all([page.waitForNavigation(), page.keyboard.press("Enter")]);
      assert.equal(await page.getByRole("table").count(), 1);
      await page.keyboard.press("Tab");
      const skip = page.getByRole("link", { name: "Skip to content" });
      assert.ok(await skip.evaluate((element) => element === document.activeElement));
      await page.keyboard.press("Enter");
      await page.keyboard.press("Tab");
      const all = page.getByRole("link", { name: "Download all" });
      assert.ok(await all.evaluate((element) => element === document.activeElement));
      const outline = await all.evaluate((element) => getComputedStyle(element).outlineStyle);
      assert.equal(outline, "solid");
    },
    withoutScript,
  );

  visit(
    "speaks German to those who want it",
    async (page) => {
      await page.goto(address);
      assert.equal(await page.locator("html").getAttribute("lang"), "de");
      await page.getByLabel("Passwort").fill(passwords.link);
      await follow(page.getByRole("button", { name: "Öffnen" }));
      const row = page.getByRole("row", { name: "Tickets.pdf" });
      assert.equal(await row.locator("time").innerText(), "02.08.2026, 16:20");
    },
    { ...withoutScript, locale: "de-CH" },
  );

  for (const width of phones) {
    visit(
      `fits into ${width} pixels`,
      async (page) => {
        await page.goto(address);
        await expectNoOverflow(page, "password page");
        await enter(page, address);
        await expectNoOverflow(page, "folder page");
        await page.getByLabel("Select letters").check();
        await expectNoOverflow(page, "folder page with a selection");
        for (const name of [...world.files, "letters/"]) {
          await page.goto(`${address}/${encodeURI(name)}`);
          await expectNoOverflow(page, name);
        }
      },
      { width, height: 640 },
    );
  }

  for (const colorScheme of ["light", "dark"]) {
    visit(
      `has no barrier that axe finds, ${colorScheme}`,
      async (page) => {
        await page.goto(address);
        await expectAccessible(page, "password page");
        await enter(page, address);
        await expectAccessible(page, "folder page");
        for (const name of [...world.files, "letters/"]) {
          await page.goto(`${address}/${encodeURI(name)}`);
          await expectAccessible(page, name);
        }
      },
      { colorScheme },
    );
  }
});

describe("a link that leads elsewhere", () => {
  visit(
    "goes on there after the login",
    async (page) => {
      const elsewhere = createServer((request, response) => response.end("elsewhere"));
      await new Promise((resolve) => elsewhere.listen(0, "127.0.0.1", resolve));
      const target = `http://127.0.0.1:${elsewhere.address().port}/album?a=1&b=2`;
      const address = world.shareWithPassword("--redirect", "always", "--redirect-uri", target);
      await enter(page, address);
      await page.waitForURL(target);
      assert.equal(await page.locator("body").innerText(), "elsewhere");
      elsewhere.close();
    },
    withoutScript,
  );
});

describe("a link for accounts", () => {
  let address;
  before(() => {
    address = world.share("--path", world.shared, "--title", "Family", "--user", "bob");
  });

  async function logIn(page, name, password) {
    await page.getByLabel("Account name").fill(name);
    await page.getByLabel("Password").fill(password);
    await follow(page.getByRole("button", { name: "Log in" }));
  }

  visit(
    "lets its account in and keeps the name after a mistake",
    async (page) => {
      await page.goto(address);
      await logIn(page, "bob", "guess");
      assert.match(await page.getByRole("alert").innerText(), /did not work/);
      assert.equal(await page.getByLabel("Account name").inputValue(), "bob");
      await logIn(page, "bob", passwords.bob);
      assert.equal(await page.getByRole("table").count(), 1);
      await follow(page.getByRole("button", { name: "Log out" }));
      assert.equal(await heading(page), "You have logged out");
    },
    withoutScript,
  );

  visit("has no barrier that axe finds", async (page) => {
    await page.goto(address);
    await expectAccessible(page, "account page");
  });
});

describe("an open link", () => {
  visit(
    "shows a large folder page by page",
    async (page) => {
      await page.goto(world.share("--path", world.makeManyFiles(501), "--title", "Many"));
      assert.equal(await page.locator("td.name").count(), 500);
      await follow(page.getByRole("link", { name: "Next page" }));
      assert.deepEqual(await page.locator("td.name bdi").allInnerTexts(), ["501.txt"]);
      await follow(page.getByRole("link", { name: "Previous page" }));
      assert.equal(await page.locator("td.name").count(), 500);
    },
    withoutScript,
  );

  visit(
    "is open at once",
    async (page) => {
      await page.goto(world.share("--path", world.shared, "--title", "Open"));
      assert.equal(await page.getByRole("table").count(), 1);
    },
    withoutScript,
  );

  visit(
    "with a number of uses asks for a click, and is gone when they are used up",
    async (page) => {
      const address = world.share("--path", world.shared, "--title", "Once", "--uses", "1");
      await page.goto(address);
      assert.equal(await page.getByRole("table").count(), 0);
      await follow(page.getByRole("button", { name: "Open" }));
      assert.equal(await page.getByRole("table").count(), 1);

      const late = await newPage(browser);
      const answer = await late.goto(address);
      assert.equal(answer.status(), 404);
      assert.equal(await heading(late), "There is nothing here");
      await late.context().close();
    },
    withoutScript,
  );

  visit(
    "that hides downloads shows previews only",
    async (page) => {
      const app = JSON.stringify({ path: world.shared, hide_download: true });
      const address = world.share("--app", app, "--title", "Look");
      await page.goto(address);
      assert.equal(await page.locator(".gallery img").count(), 5);
      assert.equal(await page.getByText("Download").count(), 0);
      assert.equal(await page.locator("input[type=checkbox]").count(), 0);
      assert.equal((await page.goto(`${address}?zip`)).status(), 404);
    },
    withoutScript,
  );
});

// Visits to an application that knows nothing of links, and that its web server puts behind one.
import assert from "node:assert/strict";
import { after, before, describe, it } from "node:test";
import { expectAccessible, expectNoOverflow, launch, newPage } from "./support/browser.mjs";
import { phones } from "./support/browser.mjs";
import { GuardedSite } from "./support/guarded_site.mjs";

const password = "open sesame";
const wanted = "/some/page?a=1&b=%2Fx";

let browser;
before(async () => {
  browser = await launch();
});
after(() => browser?.close());

for (const webServer of ["Nginx", "Caddy", "Lighttpd", "Apache"]) {
  describe(`an application behind ${webServer}`, () => {
    let site;
    before(async () => {
      site = await GuardedSite.start(webServer);
    });
    after(() => site?.end());

    async function submit(page, text) {
      await page.getByLabel("Password").fill(text);
      await Promise.all([
        page.waitForNavigation(),
        page.getByRole("button", { name: "Open" }).click(),
      ]);
    }

    it("is reached by its address, the login page and the password", async () => {
      const page = await newPage(browser, { javaScriptEnabled: false });
      await page.goto(site.address + wanted);
      await page.waitForURL("**/sharing/**");
      assert.equal(new URL(page.url()).searchParams.get("return"), wanted);
      await submit(page, "open barley");
      assert.match(await page.getByRole("alert").innerText(), /did not work/);
      await submit(page, password);
      assert.equal(page.url(), site.address + wanted);
      assert.equal(await page.locator("body").innerText(), site.secret);
      await page.goto(`${site.address}/another/page`);
      assert.equal(await page.locator("body").innerText(), site.secret);
      await page.context().close();
    });

    it("is left by the page to log out", async () => {
      const page = await newPage(browser, { javaScriptEnabled: false });
      await page.goto(site.address + wanted);
      await page.waitForURL("**/sharing/**");
      const link = new URL(page.url()).pathname;
      await submit(page, password);
      assert.equal(await page.locator("body").innerText(), site.secret);
      await page.goto(`${site.address}${link}/logout`);
      await page.getByRole("button", { name: "Log out" }).click();
      await page.waitForURL("**?logged-out");
      await page.goto(site.address + wanted);
      await page.waitForURL("**/sharing/**");
      assert.equal(await page.getByLabel("Password").count(), 1);
      await page.context().close();
    });

    it("is closed to the next visitor", async () => {
      const page = await newPage(browser, { javaScriptEnabled: false });
      await page.goto(`${site.address}/another/page`);
      await page.waitForURL("**/sharing/**");
      assert.equal(await page.getByLabel("Password").count(), 1);
      await page.context().close();
    });
  });
}

// Where the web server hands the answer to its question through.
describe("the page that leads to the login", () => {
  let site;
  before(async () => {
    site = await GuardedSite.start("Apache");
  });
  after(() => site?.end());

  // It goes on by itself at once, unless it is held.
  async function hold(options) {
    const page = await newPage(browser, { javaScriptEnabled: false, ...options });
    await page.route("**/sharing/*?return=*", (route) => route.fulfill({ status: 204 }));
    const answer = await page.goto(site.address + wanted);
    assert.equal(answer.status(), 401);
    return page;
  }

  for (const width of phones) {
    it(`fits into ${width} pixels`, async () => {
      const page = await hold({ width, height: 640 });
      await expectNoOverflow(page, "401");
      await page.context().close();
    });
  }

  for (const colorScheme of ["light", "dark"]) {
    it(`has no barrier that axe finds, ${colorScheme}`, async () => {
      const page = await hold({ colorScheme, javaScriptEnabled: true });
      await expectAccessible(page, "401");
      await page.context().close();
    });
  }

  it("can be followed by hand", async () => {
    const page = await hold();
    const [login] = await Promise.all([
      page.waitForRequest("**/sharing/*?return=*"),
      page.getByRole("main").getByRole("link", { name: "Log in" }).click(),
    ]);
    assert.equal(new URL(login.url()).searchParams.get("return"), wanted);
    await page.context().close();
  });

  it("speaks German to those who want it, with all its letters", async () => {
    const page = await hold({ locale: "de-DE" });
    assert.equal(await page.locator("html").getAttribute("lang"), "de");
    assert.match(await page.getByRole("main").innerText(), /[äöüß…]/);
    assert.doesNotMatch(await page.getByRole("main").innerText(), /Ã|â€/);
    await page.context().close();
  });
});

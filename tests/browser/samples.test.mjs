// Every kind of page, those too that a server shows only when something is wrong.
import assert from "node:assert/strict";
import { readdirSync } from "node:fs";
import { after, before, describe, it } from "node:test";
import { expectAccessible, expectNoOverflow, launch, newPage } from "./support/browser.mjs";
import { phones, watchConsole } from "./support/browser.mjs";
import { serveSamples } from "./support/sample_server.mjs";

for (const language of ["en", "de"]) {
  const folder = `${process.env.SAMPLES_DIR}/${language}`;
  const samples = readdirSync(folder).filter((name) => name.endsWith(".html"));

  describe(`sample pages, ${language}`, () => {
    let browser, server;
    before(async () => {
      browser = await launch();
      server = await serveSamples(folder);
    });
    after(async () => {
      await browser?.close();
      server?.close();
    });

    it("are all there", () => assert.ok(samples.length >= 15));

    for (const width of phones) {
      it(`fit into ${width} pixels`, async () => {
        const page = await newPage(browser, { width, height: 640 });
        for (const name of samples) {
          await page.goto(server.address(name));
          await expectNoOverflow(page, name);
        }
        await page.context().close();
      });
    }

    for (const colorScheme of ["light", "dark"]) {
      it(`have no barrier that axe finds, ${colorScheme}`, async () => {
        const page = await newPage(browser, { colorScheme });
        for (const name of samples) {
          await page.goto(server.address(name));
          await expectAccessible(page, name);
        }
        await page.context().close();
      });
    }

    it("stay within their own content security policy", async () => {
      const page = await newPage(browser);
      const complaints = watchConsole(page);
      for (const name of samples) await page.goto(server.address(name));
      assert.deepEqual(complaints, []);
      await page.context().close();
    });

    it("print without buttons", async () => {
      const page = await newPage(browser);
      await page.goto(server.address("sample-folder.html"));
      assert.ok(await page.locator(".bar button").isVisible());
      await page.emulateMedia({ media: "print" });
      for (const button of await page.locator("button, .button, input").all()) {
        assert.ok(!(await button.isVisible()));
      }
      await page.context().close();
    });
  });
}

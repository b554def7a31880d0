// The browser, and what the tests ask of every page.
import assert from "node:assert/strict";
import { readFileSync } from "node:fs";
import { createRequire } from "node:module";

// Installed into the build folder, not beside this file.
const modules = createRequire(`${process.env.BROWSER_MODULES}/`);
const { chromium } = modules("playwright-core");
const axe = readFileSync(modules.resolve("axe-core/axe.min.js"), "utf8");

export const phones = [320, 390];

export function launch() {
  // Tests run as root on CI, where the browser's own sandbox cannot.
  return chromium.launch({
    executablePath: process.env.CHROMIUM ?? "/usr/bin/chromium",
    args: process.getuid() === 0 ? ["--no-sandbox"] : [],
  });
}

// A page in a browser without history, cookies or script of the site's own.
export async function newPage(browser, { width = 1200, height = 800, ...options } = {}) {
  const context = await browser.newContext({
    viewport: { width, height },
    locale: "en-GB",
    timezoneId: "UTC",
    bypassCSP: false,
    ...options,
  });
  return context.newPage();
}

// Nothing sticks out: the page is not to be pushed sideways.
export async function expectNoOverflow(page, where) {
  const [needed, given] = await page.evaluate(() => [
    document.documentElement.scrollWidth,
    document.documentElement.clientWidth,
  ]);
  assert.ok(needed <= given, `${where}: ${needed} pixels wide in a window of ${given}`);
}

// axe runs through the debugger, which no content security policy keeps out.
export async function expectAccessible(page, where) {
  await page.evaluate(axe);
  const result = await page.evaluate(() =>
    window.axe.run(document, { resultTypes: ["violations"] }),
  );
  assert.ok(result.passes.length > 0, `${where}: axe looked at nothing`);
  const findings = result.violations.map(
    (found) =>
      `${where}: ${found.id} (${found.impact}): ${found.help}: ` +
      found.nodes.map((node) => node.html).join(" "),
  );
  assert.deepEqual(findings, []);
}

// Collects what the browser complains about, refused content above all.
export function watchConsole(page) {
  const complaints = [];
  page.on("console", (message) => {
    if (["error", "warning"].includes(message.type())) complaints.push(message.text());
  });
  page.on("pageerror", (error) => complaints.push(String(error)));
  return complaints;
}

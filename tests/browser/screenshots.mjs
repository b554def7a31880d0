// Takes the pictures of docs/images from the running program.
import { mkdirSync } from "node:fs";
import { fileURLToPath } from "node:url";
import { launch, newPage } from "./support/browser.mjs";
import { World, passwords } from "./support/world.mjs";

const folder = fileURLToPath(new URL("../../docs/images", import.meta.url));
const desk = { width: 1100, height: 720 };
const phone = { width: 390, height: 800, deviceScaleFactor: 2 };

mkdirSync(folder, { recursive: true });
const browser = await launch();
const world = await World.make(browser);
try {
  await takeAll();
} finally {
  await world.end();
  await browser.close();
}

async function takeAll() {
  const guarded = world.shareWithPassword();
  const forBob = world.share("--path", world.shared, "--title", "Family album", "--user", "bob");
  const missing = world.address("/sharing/aB3xK9pQ2");
  await take("web-password-light", guarded, [], desk);
  await take("web-password-wrong-dark", guarded, [["Password", "open barley"]], dark(desk));
  await take("web-account-phone", forBob, [], phone);
  const right = [["Password", passwords.link]];
  await take("web-folder-light", guarded, right, { ...desk, height: 1020 });
  await take("web-folder-dark", guarded, right, dark({ ...desk, height: 1020 }));
  await take("web-folder-phone", guarded, right, { ...phone, height: 1320 });
  await take("web-image-light", guarded, right, desk, "/Beach.png");
  await take("web-text-phone-dark", guarded, right, dark(phone), "/read%20me.txt");
  await take("web-pdf-light", guarded, right, desk, "/Tickets.pdf");
  await take("web-missing-light", missing, [], desk);
}

function dark(options) {
  return { ...options, colorScheme: "dark" };
}

// Fills the fields of the first page, goes on to `path` below the link, and takes a picture.
async function take(name, address, fields, options, path = "") {
  const page = await newPage(browser, options);
  await page.goto(address);
  for (const [label, text] of fields) await page.getByLabel(label).fill(text);
  if (fields.length > 0) {
    await Promise.all([
      page.waitForNavigation({ waitUntil: "networkidle" }),
      page.keyboard.press("Enter"),
    ]);
  }
  if (path) await page.goto(address + path, { waitUntil: "networkidle" });
  await page.screenshot({ path: `${folder}/${name}.png` });
  await page.context().close();
}

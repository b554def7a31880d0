// What is shared in the tests, painted and written by the browser itself.
import { newPage } from "./browser.mjs";

const scenes = {
  "Beach.png": `<linearGradient id="a" x2="0" y2="1"><stop stop-color="#9cd3f2"/><stop offset="1" stop-color="#eef7f6"/></linearGradient>
    <path fill="url(#a)" d="M0 0h800v600H0z"/><circle cx="610" cy="130" r="60" fill="#fff3c4"/>
    <path fill="#2f8fb3" d="M0 300h800v140H0z"/><path fill="#62b6cc" d="M0 390q100-25 200 0t200 0 200 0 200 0v60H0z"/>
    <path fill="#ecd9ae" d="M0 440q200-30 400 0t400-10v170H0z"/>`,
  "Hills.png": `<path fill="#f6d9b8" d="M0 0h800v600H0z"/><circle cx="220" cy="210" r="55" fill="#fdf4dc"/>
    <path fill="#b9a9b8" d="M0 330q130-120 280-20t260-60 260 60v300H0z"/>
    <path fill="#7f8fa3" d="M0 410q160-110 330-10t240-40 230 30v220H0z"/>
    <path fill="#45606b" d="M0 490q180-80 360 0t440-20v140H0z"/>`,
  "Harbour.png": `<path fill="#cfe0ea" d="M0 0h800v600H0z"/><path fill="#52728c" d="M0 400h800v200H0z"/>
    <path fill="#f4f1ea" d="M170 150l20 230H70zM470 110l10 270H340z"/><path fill="#b0413e" d="M60 390h160l-30 50H90z"/>
    <path fill="#2d3e50" d="M330 390h210l-40 60H370z"/><path fill="#8aa5b8" d="M0 500q100-14 200 0t200 0 200 0 200 0v30H0z"/>`,
  "Forest.png": `<path fill="#dfe9dc" d="M0 0h800v600H0z"/><path fill="#8fb09a" d="M90 470l90-330 90 330zM480 470l110-360 110 360z"/>
    <path fill="#4f7f63" d="M250 520l110-400 110 400zM620 520l90-310 90 310zM-60 520L40 200l100 320z"/>
    <path fill="#2f5442" d="M0 500h800v100H0z"/>`,
  "Evening.png": `<linearGradient id="a" x2="0" y2="1"><stop stop-color="#2b2f63"/><stop offset=".6" stop-color="#c8627a"/><stop offset="1" stop-color="#f7b267"/></linearGradient>
    <path fill="url(#a)" d="M0 0h800v600H0z"/><circle cx="400" cy="380" r="70" fill="#ffe3a3"/><path fill="#231f3d" d="M0 400h800v200H0z"/>
    <path fill="#f7b267" d="M340 430h120v6H340zM320 460h160v6H320zM350 490h100v6H350z"/>`,
};

// Names and bytes of a few pictures.
export async function paint(browser) {
  const page = await newPage(browser, { width: 800, height: 600 });
  const pictures = {};
  for (const [name, shapes] of Object.entries(scenes)) {
    await page.setContent(
      `<style>body{margin:0}svg{display:block}</style><svg viewBox="0 0 800 600">${shapes}</svg>`,
    );
    pictures[name] = await page.screenshot();
  }
  await page.context().close();
  return pictures;
}

export async function print(browser) {
  const page = await newPage(browser);
  await page.setContent("<h1>Train tickets</h1><p>Two adults, two children, window seats.</p>");
  const bytes = await page.pdf();
  await page.context().close();
  return bytes;
}

// A second of a quiet tone, as a WAV file.
export function tone() {
  const rate = 8000;
  const header = Buffer.alloc(44);
  header.write("RIFF", 0);
  header.writeUInt32LE(36 + rate, 4);
  header.write("WAVEfmt ", 8);
  header.writeUInt32LE(16, 16);
  header.writeUInt16LE(1, 20);
  header.writeUInt16LE(1, 22);
  header.writeUInt32LE(rate, 24);
  header.writeUInt32LE(rate, 28);
  header.writeUInt16LE(1, 32);
  header.writeUInt16LE(8, 34);
  header.write("data", 36);
  header.writeUInt32LE(rate, 40);
  const wave = Array.from({ length: rate }, (_, i) => 128 + Math.round(40 * Math.sin(i / 4)));
  return Buffer.concat([header, Buffer.from(wave)]);
}

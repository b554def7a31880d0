// Serves the sample pages with the headers that the program sends with its own.
import { readFile } from "node:fs/promises";
import { createServer } from "node:http";
import { basename, extname, join } from "node:path";

const types = { ".html": "text/html; charset=utf-8", ".css": "text/css", ".svg": "image/svg+xml" };

export async function serveSamples(folder) {
  const policy = (await readFile(join(folder, "policy"), "utf8")).trim();
  const server = createServer(async (request, response) => {
    const name = basename(new URL(request.url, "http://localhost").pathname);
    const path = join(folder, name.endsWith(".html") ? "" : "-", name);
    try {
      const bytes = await readFile(path);
      response.writeHead(200, {
        "Content-Type": types[extname(name)] ?? "application/octet-stream",
        "Content-Security-Policy": policy,
        "X-Content-Type-Options": "nosniff",
      });
      response.end(bytes);
    } catch {
      response.writeHead(404).end();
    }
  });
  await new Promise((resolve) => server.listen(0, "127.0.0.1", resolve));
  return {
    address: (name) => `http://127.0.0.1:${server.address().port}/${name}`,
    close: () => server.close(),
  };
}

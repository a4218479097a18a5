#!/usr/bin/env node
// Serves the page and the module over HTTP on localhost, where browsers
// allow the microphone:
//
//   node web/serve.mjs [PORT]     (default 8000; then open http://localhost:8000/)
//
// Static files from web/ only, with the types browsers insist on
// (application/wasm for streaming compilation, text/javascript for modules
// and worklets) and no caching, so that a rebuilt module is picked up.

import { createReadStream } from 'node:fs';
import { stat } from 'node:fs/promises';
import { createServer } from 'node:http';
import { extname, normalize, sep } from 'node:path';
import { fileURLToPath } from 'node:url';

const ROOT = fileURLToPath(new URL('.', import.meta.url));
const TYPES = {
  '.html': 'text/html; charset=utf-8',
  '.js': 'text/javascript; charset=utf-8',
  '.mjs': 'text/javascript; charset=utf-8',
  '.wasm': 'application/wasm',
  '.css': 'text/css; charset=utf-8',
  '.ts': 'text/plain; charset=utf-8',
};

/** An HTTP server for web/ (not yet listening). */
export function webServer() {
  return createServer(async (request, response) => {
    const path = decodeURIComponent(new URL(request.url, 'http://localhost').pathname);
    const file = normalize(ROOT + (path.endsWith('/') ? `${path}index.html` : path));
    const stats = file.startsWith(ROOT) && !file.includes(`${sep}.`) ?
      await stat(file).catch(() => null) : null;
    if (!stats?.isFile()) {
      response.writeHead(404, { 'content-type': 'text/plain' }).end('not found\n');
      return;
    }
    response.writeHead(200, {
      'content-type': TYPES[extname(file)] ?? 'application/octet-stream',
      'content-length': stats.size,
      'cache-control': 'no-store',
    });
    createReadStream(file).pipe(response);
  });
}

if (process.argv[1] && fileURLToPath(import.meta.url) === normalize(process.argv[1])) {
  const port = Number(process.argv[2] ?? 8000);
  webServer().listen(port, 'localhost', () => {
    console.log(`Vesk page: http://localhost:${port}/ (Ctrl-C stops)`);
  });
}

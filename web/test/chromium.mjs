// A headless Chromium driven through the DevTools protocol over a pipe
// (--remote-debugging-pipe: JSON messages separated by NUL bytes on file
// descriptors 3 and 4), enough for the page test: open a page, evaluate
// script in it as a user gesture, take screenshots. No npm packages, no
// network port, no browser download: the Debian chromium binary.

import { spawn } from 'node:child_process';
import { mkdtempSync, rmSync } from 'node:fs';
import { tmpdir } from 'node:os';
import { join } from 'node:path';

export const CHROMIUM = process.env.CHROMIUM ?? '/usr/bin/chromium';

export class Chromium {
  #child;
  #profile;
  #nextId = 1;
  #pending = new Map();
  #listeners = new Set();
  #received = '';
  /** Console lines and exceptions of the page, for failure messages. */
  console = [];

  /** Starts Chromium with `extraFlags` added to the headless set. */
  static async launch(extraFlags = []) {
    const browser = new Chromium();
    browser.#profile = mkdtempSync(join(tmpdir(), 'vesk-chromium-'));
    const flags = [
      '--headless', '--no-sandbox', '--disable-gpu', '--no-first-run',
      // This machine's network is closed: no background connections.
      '--disable-background-networking', '--disable-component-update', '--disable-sync',
      '--disable-default-apps', '--no-default-browser-check',
      `--user-data-dir=${browser.#profile}`, '--remote-debugging-pipe', ...extraFlags,
    ];
    browser.#child = spawn(CHROMIUM, flags,
                           { stdio: ['ignore', 'ignore', 'pipe', 'pipe', 'pipe'] });
    browser.#child.stderr.on('data', () => {}); // Chromium is chatty; drain it.
    browser.#child.stdio[4].on('data', (data) => browser.#read(data));
    browser.#child.on('exit', (code) => {
      for (const { reject } of browser.#pending.values()) {
        reject(new Error(`chromium exited (${code})`));
      }
      browser.#pending.clear();
    });
    await browser.send('Browser.getVersion');
    return browser;
  }

  #read(data) {
    this.#received += data.toString('utf8');
    let end;
    while ((end = this.#received.indexOf('\0')) >= 0) {
      const message = JSON.parse(this.#received.slice(0, end));
      this.#received = this.#received.slice(end + 1);
      if (message.id && this.#pending.has(message.id)) {
        const { resolve, reject, method } = this.#pending.get(message.id);
        this.#pending.delete(message.id);
        if (message.error) reject(new Error(`${method}: ${message.error.message}`));
        else resolve(message.result);
      } else if (message.method) {
        for (const listener of this.#listeners) listener(message);
      }
    }
  }

  /** Sends a protocol command (to a page when `sessionId` is given). */
  send(method, params = {}, sessionId = undefined) {
    const id = this.#nextId++;
    const message = JSON.stringify({ id, method, params, sessionId });
    return new Promise((resolve, reject) => {
      this.#pending.set(id, { resolve, reject, method });
      this.#child.stdio[3].write(`${message}\0`);
    });
  }

  /** Resolves with the first event `method` of `sessionId` that `accept` takes. */
  waitFor(method, sessionId, accept = () => true) {
    return new Promise((resolve) => {
      const listener = (message) => {
        if (message.method === method && message.sessionId === sessionId &&
            accept(message.params)) {
          this.#listeners.delete(listener);
          resolve(message.params);
        }
      };
      this.#listeners.add(listener);
    });
  }

  /** Opens `url` in a new tab and waits for its load event. */
  async open(url) {
    const { targetId } = await this.send('Target.createTarget', { url: 'about:blank' });
    const { sessionId } = await this.send('Target.attachToTarget', { targetId, flatten: true });
    const page = new Page(this, sessionId);
    this.#listeners.add((message) => {
      if (message.sessionId !== sessionId) return;
      if (message.method === 'Runtime.consoleAPICalled') {
        this.console.push(`${message.params.type}: ` +
          message.params.args.map((a) => a.value ?? a.description).join(' '));
      } else if (message.method === 'Runtime.exceptionThrown') {
        const details = message.params.exceptionDetails;
        this.console.push(`exception: ${details.exception?.description ?? details.text}`);
      }
    });
    await this.send('Runtime.enable', {}, sessionId);
    await this.send('Page.enable', {}, sessionId);
    const loaded = this.waitFor('Page.loadEventFired', sessionId);
    await this.send('Page.navigate', { url }, sessionId);
    await loaded;
    return page;
  }

  async close() {
    if (this.#child.exitCode === null) {
      const exited = new Promise((resolve) => this.#child.once('exit', resolve));
      this.send('Browser.close').catch(() => {});
      const timer = setTimeout(() => this.#child.kill('SIGKILL'), 5000);
      await exited;
      clearTimeout(timer);
    }
    rmSync(this.#profile, { recursive: true, force: true });
  }
}

class Page {
  constructor(browser, sessionId) {
    this.browser = browser;
    this.sessionId = sessionId;
  }

  /**
   * The value of `expression` (awaited when it is a promise), evaluated as
   * if the user had just clicked, so that audio may start.
   */
  async evaluate(expression) {
    const { result, exceptionDetails } = await this.browser.send('Runtime.evaluate', {
      expression, awaitPromise: true, returnByValue: true, userGesture: true,
    }, this.sessionId);
    if (exceptionDetails) {
      const why = exceptionDetails.exception?.description ?? exceptionDetails.text;
      throw new Error(`${expression}: ${why}`);
    }
    return result.value;
  }

  /** Polls `expression` until it is truthy; its value, or an Error after `seconds`. */
  async until(expression, seconds, what) {
    const deadline = Date.now() + seconds * 1000;
    for (;;) {
      const value = await this.evaluate(expression);
      if (value) return value;
      if (Date.now() > deadline) {
        throw new Error(`${what} did not happen within ${seconds} s. Page console:\n  ` +
                        this.browser.console.join('\n  '));
      }
      await new Promise((resolve) => setTimeout(resolve, 100));
    }
  }

  /** A PNG of the page as shown. */
  async screenshot() {
    const { data } = await this.browser.send('Page.captureScreenshot',
                                             { format: 'png', captureBeyondViewport: true },
                                             this.sessionId);
    return Buffer.from(data, 'base64');
  }
}

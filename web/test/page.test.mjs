// The page in a real browser: headless Chromium opens it from a local
// server with a fake microphone that plays a WAV of tokens (made here by the
// WebAssembly encoder), presses Listen and waits for the message to appear,
// then presses Send and checks through the page's output tap that audio was
// played. One browser per modem (the fake microphone is fixed at launch).
// Screenshots go to VESK_WEB_TEST_OUTPUT (default build/web-test).

import assert from 'node:assert/strict';
import { mkdirSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { after, before, test } from 'node:test';
import { fileURLToPath } from 'node:url';

import { Vesk } from '../dist/vesk.js';
import { webServer } from '../serve.mjs';
import { Chromium } from './chromium.mjs';

const OUTPUT = process.env.VESK_WEB_TEST_OUTPUT ??
  fileURLToPath(new URL('../../build/web-test', import.meta.url));
mkdirSync(OUTPUT, { recursive: true });

const vesk = await Vesk.load();
let server;
let origin;

before(async () => {
  server = webServer();
  await new Promise((resolve) => server.listen(0, '127.0.0.1', resolve));
  origin = `http://127.0.0.1:${server.address().port}`;
});

after(() => server.close());

// A 16-bit mono WAV of `samples` (-1 ... 1) at `rate`.
function wav(samples, rate) {
  const data = Buffer.alloc(44 + 2 * samples.length);
  data.write('RIFF', 0);
  data.writeUInt32LE(36 + 2 * samples.length, 4);
  data.write('WAVEfmt ', 8);
  data.writeUInt32LE(16, 16);
  data.writeUInt16LE(1, 20); // PCM
  data.writeUInt16LE(1, 22); // mono
  data.writeUInt32LE(rate, 24);
  data.writeUInt32LE(2 * rate, 28);
  data.writeUInt16LE(2, 32);
  data.writeUInt16LE(16, 34);
  data.write('data', 36);
  data.writeUInt32LE(2 * samples.length, 40);
  samples.forEach((s, i) => {
    data.writeInt16LE(Math.max(-32768, Math.min(32767, Math.round(s * 32767))), 44 + 2 * i);
  });
  return data;
}

// The fake microphone's file: a second of silence, then the token three
// times; Chromium plays it in a loop.
function tokenWav(modem, message) {
  const encoder = vesk.encoder({ modem });
  const token = encoder.encode(message);
  encoder.close();
  const rate = token.sample_rate_hz;
  const played = token.playback(3);
  const samples = new Float32Array(rate + played.length);
  samples.set(played, rate);
  const file = join(OUTPUT, `microphone-${modem}.wav`);
  writeFileSync(file, wav(samples, rate));
  return file;
}

const byId = (id) => `document.getElementById(${JSON.stringify(id)})`;

for (const [modem, text] of [['dsss', 'vesk:)'], ['dtmf', 'hi!']]) {
  test(`the page hears ${modem.toUpperCase()} through the microphone and sends it`, async () => {
    const message = new Uint8Array(vesk.defaults(modem).message_bytes);
    message.set(new TextEncoder().encode(text));
    const hex = Buffer.from(message).toString('hex');
    const browser = await Chromium.launch([
      '--use-fake-ui-for-media-stream', '--use-fake-device-for-media-stream',
      `--use-file-for-fake-audio-capture=${tokenWav(modem, message)}`,
    ]);
    try {
      const page = await browser.open(`${origin}/index.html`);
      await page.until(`${byId('module-status')}.textContent.includes('WebAssembly')`, 20,
                       'loading the module');
      await page.evaluate(`document.querySelector('input[name=modem][value=${modem}]').click()`);

      await page.evaluate(`${byId('listen-button')}.click()`);
      await page.until(`${byId('listen-status')}.textContent.startsWith('Listening')`, 10,
                       'listening');
      const heard = await page.until(`${byId('tokens')}.textContent`, 20, `hearing ${hex}`);
      assert.match(heard, new RegExp(`${hex} "${text.replace(/[()]/g, '\\$&')}"`));

      // Send the same message; the output tap sees it played.
      await page.evaluate(`${byId('format')}.value = 'hex'; ${byId('message')}.value = '${hex}';
                           ${byId('repeat')}.value = '1'; ${byId('send-button')}.click()`);
      const peak = await page.until(`${byId('send-status')}.dataset.peak`, 10, 'sending');
      assert.ok(Number(peak) > 0.1, `played at peak ${peak}`);
      assert.match(await page.evaluate(`${byId('send-status')}.textContent`),
                   new RegExp(`^Sent ${hex} \\(${modem.toUpperCase()}\\)`));
      writeFileSync(join(OUTPUT, `page-${modem}.png`), await page.screenshot());
      assert.deepEqual(browser.console.filter((line) => line.startsWith('exception')), []);
    } finally {
      await browser.close();
    }
  });
}

// Opens the page in `browser`, loads the module and presses Listen; the
// listening status once it says something is wrong.
async function listenForError(browser, prepare = '') {
  const page = await browser.open(`${origin}/index.html`);
  await page.until(`${byId('module-status')}.textContent.includes('WebAssembly')`, 20,
                   'loading the module');
  if (prepare) await page.evaluate(prepare);
  await page.evaluate(`${byId('listen-button')}.click()`);
  const status = await page.until(
    `${byId('listen-status')}.classList.contains('error') && ${byId('listen-status')}.textContent`,
    10, 'an error message');
  return { page, status };
}

test('the page says when the microphone is refused', async () => {
  // Without the fake permission prompt, a headless browser refuses.
  const browser = await Chromium.launch(['--use-fake-device-for-media-stream',
                                         '--deny-permission-prompts']);
  try {
    const { page, status } = await listenForError(browser);
    assert.match(status, /^The microphone was refused\./);
    writeFileSync(join(OUTPUT, 'page-refused.png'), await page.screenshot());
  } finally {
    await browser.close();
  }
});

test('the page says when the microphone is too slow for the modem', async () => {
  const browser = await Chromium.launch(['--use-fake-ui-for-media-stream',
                                         '--use-fake-device-for-media-stream']);
  try {
    // A 16 kHz headset: the track reports its rate.
    const { status } = await listenForError(browser, `{
      const settings = MediaStreamTrack.prototype.getSettings;
      MediaStreamTrack.prototype.getSettings = function () {
        return { ...settings.call(this), sampleRate: 16000 };
      };
    }`);
    assert.equal(status, 'The microphone delivers 16000 Hz, too low for DSSS, which needs at ' +
                         'least 37000 Hz. Choose DTMF, or use another microphone.');
  } finally {
    await browser.close();
  }
});

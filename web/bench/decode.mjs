#!/usr/bin/env node
// Cost of decoding in WebAssembly on one thread, beside the native figure:
// seconds of audio decoded per second of CPU ("× real time") for noise from
// a mono microphone fed in 4096-sample chunks, each decoder asking for
// tokens every 0.25 s of stream time (the default). The native program
// (src/vesk/vesk_benchmark.cc) decodes the same samples in the same chunks
// through the same C interface.
//
//   node web/bench/decode.mjs [--native PATH] [--runs N] [--seconds S]
//
// --native  the native benchmark program (default
//           build/host/src/vesk/vesk_c_benchmark; skipped when absent)
// --runs    timed runs per case; the best is reported (default 5)
// --seconds audio decoded per run, seconds of stream time (default 60)
//
// The module is warmed up first (V8 compiles WebAssembly in two tiers; the
// second arrives after a moment). CPU time is the whole process's, so the
// figure is, if anything, low.

import { execFileSync } from 'node:child_process';
import { existsSync } from 'node:fs';
import { fileURLToPath } from 'node:url';
import { parseArgs } from 'node:util';

import { Vesk } from '../dist/vesk.js';

const CHUNK = 4096;
const CASES = [
  { modem: 'dsss', rate: 44100 },
  { modem: 'dsss', rate: 48000 },
  { modem: 'dtmf', rate: 44100 },
  { modem: 'dtmf', rate: 48000 },
];

const root = fileURLToPath(new URL('../..', import.meta.url));
const { values: args } = parseArgs({
  options: {
    native: { type: 'string', default: `${root}build/host/src/vesk/vesk_c_benchmark` },
    runs: { type: 'string', default: '5' },
    seconds: { type: 'string', default: '60' },
  },
});

// Eight seconds of the native program's noise: a sum of four uniforms from
// the same linear congruential generator, 16-bit.
function noise(rate) {
  const samples = new Int16Array(rate * 8);
  let seed = 1;
  for (let i = 0; i < samples.length; ++i) {
    let sum = 0;
    for (let k = 0; k < 4; ++k) {
      seed = (Math.imul(seed, 1664525) + 1013904223) >>> 0;
      sum += Math.fround(Math.fround((seed >>> 8) / 16777216) - 0.5);
      sum = Math.fround(sum);
    }
    samples[i] = Math.trunc(Math.fround(2000 * sum));
  }
  return samples;
}

// Feeds `seconds` of `audio` to `decoder` chunk by chunk, cycling through it.
function feed(decoder, audio, rate, seconds) {
  const chunks = Math.ceil((seconds * rate) / CHUNK);
  let offset = 0;
  for (let c = 0; c < chunks; ++c) {
    if (offset + CHUNK > audio.length) offset = 0;
    decoder.process(audio.subarray(offset, offset + CHUNK));
    decoder.tokens();
    offset += CHUNK;
  }
  return (chunks * CHUNK) / rate;
}

function cpuSeconds() {
  const { user, system } = process.cpuUsage();
  return (user + system) / 1e6;
}

async function wasmFigures() {
  const vesk = await Vesk.load();
  const figures = {};
  for (const { modem, rate } of CASES) {
    const decoder = vesk.decoder({ modem }, { microphone_rate_hz: rate });
    const audio = noise(rate);
    feed(decoder, audio, rate, 20);  // Warm-up: both compiler tiers.
    let best = 0;
    for (let run = 0; run < Number(args.runs); ++run) {
      const start = cpuSeconds();
      const stream = feed(decoder, audio, rate, Number(args.seconds));
      best = Math.max(best, stream / (cpuSeconds() - start));
    }
    decoder.close();
    figures[`${modem}/${rate}`] = best;
  }
  return figures;
}

function nativeFigures() {
  if (!existsSync(args.native)) return null;
  const json = execFileSync(args.native, [
    '--benchmark_format=json',
    `--benchmark_repetitions=${args.runs}`,
    '--benchmark_filter=BM_DecodeRealtime',
  ], { encoding: 'utf8', stdio: ['ignore', 'pipe', 'ignore'] });
  const figures = {};
  for (const b of JSON.parse(json).benchmarks) {
    if (b.run_type !== 'iteration') continue;
    const [, modem, rate] = b.run_name.match(/modem:(\d+)\/mic:(\d+)/);
    const key = `${['dsss', 'dtmf'][Number(modem)]}/${rate}`;
    figures[key] = Math.max(figures[key] ?? 0, b.realtime);
  }
  return figures;
}

const wasm = await wasmFigures();
const native = nativeFigures();
console.log('decoder/mic rate   WebAssembly   native   ratio   (× real time, best of ' +
            `${args.runs})`);
for (const key of Object.keys(wasm)) {
  const n = native?.[key];
  console.log(`${key.padEnd(18)} ${wasm[key].toFixed(0).padStart(11)}   ` +
              `${n ? n.toFixed(0).padStart(6) : '     -'}   ` +
              `${n ? `${((100 * wasm[key]) / n).toFixed(0)}%`.padStart(5) : '    -'}`);
}
if (!native) console.log(`(no native program at ${args.native}: build the host build first)`);

// The ES module over the WebAssembly build, in Node.js: loopbacks of both
// modems, chunking, the C interface's defaults and refusals, the token
// stream, close(), the log sink, and the record layout against vesk/vesk.h.

import assert from 'node:assert/strict';
import { readFileSync } from 'node:fs';
import { test } from 'node:test';

import { Vesk, VeskError } from '../dist/vesk.js';

const logLines = [];
const vesk = await Vesk.load({ log: (line) => logLines.push(line) });

const SIX = Uint8Array.of(0x01, 0x23, 0x45, 0x67, 0x89, 0xab);
const FIVE = Uint8Array.of(0x10, 0x32, 0x54, 0x76, 0x98);

// What a loudspeaker plays: half a second of silence, the transition, the
// token `repetitions` times and a second of silence.
function broadcast(config, message, repetitions = 3) {
  const encoder = vesk.encoder(config);
  const sent = encoder.encode(message);
  encoder.close();
  const rate = sent.sample_rate_hz;
  const played = sent.playback(repetitions);
  const out = new Float32Array(rate / 2 + played.length + rate);
  out.set(played, rate / 2);
  const firstEnd = 0.5 + (sent.transition.length + sent.token.length) / rate;
  return { samples: out, rate, firstEnd };
}

// Feeds `samples` in chunks of `chunk`, then flushes; every token heard.
function decode(config, options, samples, chunk) {
  const decoder = vesk.decoder(config, options);
  const heard = [];
  for (let start = 0; start < samples.length; start += chunk) {
    decoder.process(samples.subarray(start, start + chunk));
    heard.push(...decoder.tokens());
  }
  decoder.flush();
  heard.push(...decoder.tokens());
  decoder.close();
  return heard.map((t) => ({ message: Array.from(t.message), time_seconds: t.time_seconds }));
}

function toInt16(samples) {
  return Int16Array.from(samples, (s) => Math.max(-32768, Math.min(32767, Math.trunc(s * 32768))));
}

test('each modem hears what it sent, in float and 16-bit samples', () => {
  for (const [modem, message] of [['dsss', SIX], ['dtmf', FIVE]]) {
    const { samples, rate, firstEnd } = broadcast({ modem }, message);
    const options = { microphone_rate_hz: rate };
    for (const input of [samples, toInt16(samples)]) {
      const heard = decode({ modem }, options, input, 4096);
      assert.equal(heard.length, 1, `${modem} ${input.constructor.name}`);
      assert.deepEqual(heard[0].message, Array.from(message));
      // Reported at one of the first requests after the first repetition.
      assert.ok(heard[0].time_seconds >= firstEnd && heard[0].time_seconds < firstEnd + 0.5,
                `${modem} at ${heard[0].time_seconds} s, token ends at ${firstEnd} s`);
    }
  }
});

test('the listening mode and a custom DTMF tone set loop back', () => {
  const listening = broadcast({ modem: 'dsss' }, SIX);
  const heard = decode({ modem: 'dsss' },
                       { microphone_rate_hz: listening.rate, listening_mode: true },
                       listening.samples, 4096);
  assert.deepEqual(heard.map((t) => t.message), [Array.from(SIX)]);

  const config = { modem: 'dtmf', dtmf: { tone_frequencies_hz: [600, 900, 1300, 1900, 2700] } };
  const tones = broadcast(config, FIVE);
  const decoded = decode(config, { microphone_rate_hz: tones.rate }, tones.samples, 4096);
  assert.deepEqual(decoded.map((t) => t.message), [Array.from(FIVE)]);
  // Another tone set does not hear it.
  assert.deepEqual(decode({ modem: 'dtmf' }, { microphone_rate_hz: tones.rate },
                          tones.samples, 4096), []);
});

test('chunk sizes and sample types do not change what is heard, nor when', () => {
  const { samples, rate } = broadcast({ modem: 'dsss' }, SIX);
  // Every request's tokens, so that times are compared too.
  const options = { microphone_rate_hz: rate, hold_seconds: 0 };
  const reference = decode({ modem: 'dsss' }, options, samples, samples.length);
  assert.ok(reference.length >= 3, `${reference.length} reports`);
  // 128: a Web Audio render quantum; 20000: more than the module copies at once.
  for (const chunk of [128, 1000, 20000]) {
    assert.deepEqual(decode({ modem: 'dsss' }, options, samples, chunk), reference, `${chunk}`);
  }
  assert.deepEqual(decode({ modem: 'dsss' }, options, toInt16(samples), 4096), reference);
});

test('the hold time reports a token once per sighting', () => {
  const { samples, rate } = broadcast({ modem: 'dtmf' }, FIVE, 6);
  const times = (hold) => decode({ modem: 'dtmf' },
                                 { microphone_rate_hz: rate, hold_seconds: hold }, samples, 4096)
    .map((t) => t.time_seconds);
  assert.equal(times(3).length, 1);
  assert.ok(times(0).length > 6, `${times(0).length} reports`);
  // Heard again after a silence longer than the hold: reported again.
  const silence = new Float32Array(4 * rate);
  const twice = new Float32Array(2 * samples.length + silence.length);
  twice.set(samples);
  twice.set(silence, samples.length);
  twice.set(samples, samples.length + silence.length);
  assert.equal(decode({ modem: 'dtmf' }, { microphone_rate_hz: rate }, twice, 4096).length, 2);
});

test('onToken receives the tokens as process() decodes them', () => {
  const { samples, rate } = broadcast({ modem: 'dtmf' }, FIVE);
  const received = [];
  const decoder = vesk.decoder({ modem: 'dtmf' }, {
    microphone_rate_hz: rate,
    hold_seconds: 0,
    onToken: (token) => received.push([token.time_seconds, decoder.streamSeconds()]),
  });
  decoder.process(samples.subarray(0, 2 * rate));
  const early = received.length;
  decoder.process(samples.subarray(2 * rate));
  assert.ok(early >= 1 && received.length > early, `${early} then ${received.length}`);
  // Delivered during the process() call that decoded them, not later.
  for (const [time, fed] of received) assert.ok(time <= fed);
  assert.deepEqual(decoder.tokens(), []);

  // A callback that throws: the exception leaves process(), the tokens not
  // yet delivered wait in tokens().
  decoder.wipe();
  let calls = 0;
  decoder.onToken = () => {
    ++calls;
    throw new Error('callback failed');
  };
  assert.throws(() => decoder.process(samples), /callback failed/);
  assert.equal(calls, 1);
  decoder.onToken = null;
  const rest = decoder.tokens();
  assert.ok(rest.length >= 1, `${rest.length} left`);
  assert.deepEqual(Array.from(rest[0].message), Array.from(FIVE));
  decoder.close();
});

test('defaults are the C interface\'s', () => {
  const dsss = vesk.defaults('dsss');
  assert.equal(dsss.message_bytes, 6);
  assert.equal(dsss.crc_check_bytes, 2);
  assert.equal(dsss.dsss.carrier_frequency_hz, 18500);
  assert.equal(dsss.dsss.transition_seconds, 0.005);
  const dtmf = vesk.defaults('dtmf');
  assert.equal(dtmf.message_bytes, 5);
  assert.equal(dtmf.checksum_symbol, 1);
  assert.equal(dtmf.dtmf.sample_rate_hz, 44100);
  assert.equal(dtmf.dtmf.tone_frequencies_hz, null);
  assert.deepEqual(vesk.decoderDefaults(), {
    microphone_rate_hz: 44100, channels: 1, listening_mode: 0, max_tokens_per_call: 2,
    buffer_length_tokens: 4, acquisition_window_seconds: 0.75, broadcaster_threshold: 5,
    design_baseband_filter: 0, poll_interval_seconds: 0.25, hold_seconds: 3,
    narrowband_excision: 1,
  });
  // A partial configuration is completed with its modem's defaults.
  const encoder = vesk.encoder({ modem: 'dtmf', message_bytes: 3 });
  assert.equal(encoder.messageBytes, 3);
  assert.equal(encoder.config.dtmf.window_seconds, 0.05);
  const sent = encoder.encode([1, 2, 3]);
  assert.equal(sent.sample_rate_hz, 44100);
  assert.equal(sent.transition.length, 0);
  encoder.close();
  const dsssToken = vesk.encoder().encode(SIX);
  assert.equal(dsssToken.sample_rate_hz, 48000);
  assert.equal(dsssToken.transition.length, 240); // 5 ms at 48 kHz.
  assert.equal(dsssToken.token.length, 17 * 2032);
  assert.equal(vesk.version, readFileSync(new URL('../../src/vesk/vesk.h', import.meta.url), 'utf8')
    .match(/#define VESK_VERSION_STRING "([^"]+)"/)[1]);
});

test('the minimum microphone rate is twice the carrier or the highest tone', () => {
  assert.equal(vesk.minMicrophoneRate({ modem: 'dsss' }), 37000);
  assert.equal(vesk.minMicrophoneRate({ dsss: { carrier_frequency_hz: 15000 } }), 30000);
  const tones = { modem: 'dtmf', dtmf: { tone_frequencies_hz: [500, 3000, 800] } };
  assert.equal(vesk.minMicrophoneRate(tones), 6000);
  assert.ok(Math.abs(vesk.minMicrophoneRate({ modem: 'dtmf' }) - 4978.1) < 0.1);
});

test('refusals carry the C interface\'s status and sentence', () => {
  const refused = (make, status, message) => {
    assert.throws(make, (error) => {
      assert.ok(error instanceof VeskError, `${error}`);
      assert.equal(error.status, status);
      assert.equal(error.message, message);
      return true;
    });
  };
  refused(() => vesk.encoder({ message_bytes: 0 }), 'VESK_ERROR_CONFIG',
          'message_bytes must be 1 to 254 with 2 check bytes');
  refused(() => vesk.decoder({ crc_check_bytes: 1 }), 'VESK_ERROR_CONFIG',
          'crc_check_bytes must be 0 or 2');
  refused(() => vesk.encoder({ dsss: { bits_per_symbol: 3 } }), 'VESK_ERROR_CONFIG',
          'bits per symbol must be 1, 2, 4 or 8');
  refused(() => vesk.encoder({ modem: 'dtmf', dtmf: { sustain_level: 1.5 } }), 'VESK_ERROR_CONFIG',
          'the sustain amplitude must lie in [0, 1]');
  refused(() => vesk.encoder({ modem: 'dtmf', dtmf: { release_seconds: NaN } }),
          'VESK_ERROR_CONFIG', 'envelope times must be finite and non-negative');
  refused(() => vesk.encoder({ dsss: { broadcast_sample_rate_hz: 8000 } }), 'VESK_ERROR_CONFIG',
          'the carrier (18500 Hz) must lie below half the broadcast sample rate');
  refused(() => vesk.decoder({}, { microphone_rate_hz: 999 }), 'VESK_ERROR_CONFIG',
          'the microphone rate must lie in [1000, 384000] Hz');
  refused(() => vesk.decoder({ modem: 'dtmf' }, { listening_mode: 1 }), 'VESK_ERROR_CONFIG',
          'the listening mode hears DSSS transmitters only');
  refused(() => vesk.decoder({}, { listening_mode: 1, microphone_rate_hz: 36000 }),
          'VESK_ERROR_CONFIG',
          'the zintar listening mode needs a microphone rate of at least 36994 Hz');
  refused(() => vesk.decoder({}, { hold_seconds: -1 }), 'VESK_ERROR_CONFIG',
          'the hold time must be finite and not negative');
  refused(() => vesk.minMicrophoneRate({ dsss: { number_of_taps: 4 } }), 'VESK_ERROR_CONFIG',
          'the code register needs 5 to 11 taps');
  const encoder = vesk.encoder();
  refused(() => encoder.encode([1, 2, 3, 4, 5]), 'VESK_ERROR_ARGUMENT',
          'the message must have 6 bytes, not 5');
  encoder.close();
  // What the C types cannot hold is the binding's to refuse.
  assert.throws(() => vesk.encoder({ mesage_bytes: 6 }), /unknown config field mesage_bytes/);
  assert.throws(() => vesk.encoder({ dsss: { carrier: 1 } }), /unknown field dsss.carrier/);
  assert.throws(() => vesk.encoder({ dsss: 18500 }), /dsss must be an object/);
  assert.throws(() => vesk.decoder({}, { rate: 48000 }), /unknown decoder option rate/);
  assert.throws(() => vesk.encoder({ modem: 'fsk' }), /modem must be 'dsss' or 'dtmf'/);
  assert.throws(() => vesk.encoder({ message_bytes: 6.5 }),
                /message_bytes must be a 32-bit integer/);
  assert.throws(() => vesk.encoder({ message_bytes: 2 ** 32 + 6 }), TypeError);
  assert.throws(() => vesk.encoder({ message_bytes: '6' }), /must be a number/);
  assert.throws(() => vesk.encoder().encode([1, 2, 3, 4, 5, 256]), /integers 0 to 255/);
  const decoder = vesk.decoder();
  assert.throws(() => decoder.process([0, 1, 2]), /Float32Array or an Int16Array/);
  decoder.close();
});

test('close() frees the WebAssembly memory; a closed object throws', () => {
  const { samples, rate } = broadcast({ modem: 'dsss' }, SIX, 1);
  const cycle = () => {
    const decoder = vesk.decoder({}, { microphone_rate_hz: rate });
    decoder.process(samples);
    decoder.close();
    const encoder = vesk.encoder();
    encoder.encode(SIX);
    encoder.close();
  };
  for (let i = 0; i < 5; ++i) cycle();
  const settled = vesk.memoryBytes;
  // A decoder holds over a megabyte: fifty unfreed ones would grow the memory.
  for (let i = 0; i < 50; ++i) cycle();
  assert.equal(vesk.memoryBytes, settled);

  const encoder = vesk.encoder();
  const decoder = vesk.decoder();
  encoder.close();
  decoder.close();
  encoder.close(); // Idempotent.
  decoder.close();
  const closed = (call, what) => assert.throws(call, (error) => error instanceof VeskError &&
    error.status === 'VESK_ERROR_ARGUMENT' && error.message === `the ${what} is closed`);
  closed(() => encoder.encode(SIX), 'encoder');
  for (const call of [() => decoder.process(new Float32Array(10)), () => decoder.flush(),
                      () => decoder.tokens(), () => decoder.broadcasterDetected(),
                      () => decoder.streamSeconds(), () => decoder.wipe()]) {
    closed(call, 'decoder');
  }
});

test('broadcasterDetected() follows the DSSS transmitter', () => {
  const { samples, rate } = broadcast({ modem: 'dsss' }, SIX);
  const decoder = vesk.decoder({}, { microphone_rate_hz: rate });
  assert.equal(decoder.broadcasterDetected(), false);
  decoder.process(samples.subarray(0, samples.length - rate)); // Ends inside the token.
  assert.equal(decoder.broadcasterDetected(), true);
  decoder.process(new Float32Array(3 * rate));
  assert.equal(decoder.broadcasterDetected(), false);
  assert.equal(decoder.streamSeconds(), (samples.length + 2 * rate) / rate);
  decoder.close();
});

test('log lines reach the log function with severity, tag and source unit', () => {
  // Over a thousand untaken reports fill the decoder's queue: it warns.
  const { samples, rate } = broadcast({ modem: 'dtmf' }, FIVE, 25);
  const decoder = vesk.decoder({ modem: 'dtmf' }, {
    microphone_rate_hz: rate, hold_seconds: 0, poll_interval_seconds: 0.01,
  });
  logLines.length = 0;
  decoder.process(samples);
  decoder.close();
  assert.ok(logLines.length >= 1);
  const line = /^W\/Vesk: social\/tandry\/audio\/token_stream\.cc:(\d+)\] (.*)$/.exec(logLines[0]);
  assert.ok(line, logLines[0]);
  assert.equal(line[2], 'Token queue full: the oldest untaken token is dropped.');
});

// The module reads and writes the C records by the layout of vesk_web.cc: a
// field added to vesk/vesk.h but not there would be left uninitialised.
test('the record layout covers vesk/vesk.h', () => {
  const header = readFileSync(new URL('../../src/vesk/vesk.h', import.meta.url), 'utf8')
    .replace(/\/\*[\s\S]*?\*\//g, '');
  const fieldsOf = (name) => {
    const body = header.match(new RegExp(`typedef struct ${name} \\{([^}]*)\\} ${name};`))[1];
    return body.split(';').map((d) => d.trim()).filter(Boolean)
      .map((d) => ({ type: d.replace(/\s*\**\w+$/, ''), name: d.match(/(\w+)$/)[1] }));
  };
  // The waveform records nest in vesk_config as "dsss.<field>" and "dtmf.<field>".
  const flatten = (name) => fieldsOf(name).flatMap(({ type, name: field }) =>
    (/^vesk_\w+_waveform$/.test(type) ?
      flatten(type).map((inner) => `${field}.${inner}`) : [field]));
  const expected = { config: flatten('vesk_config'), options: flatten('vesk_decoder_options') };
  assert.ok(expected.config.includes('dsss.carrier_frequency_hz'));
  assert.ok(expected.config.includes('dtmf.num_tones'));
  // The config object shows every field but the tone count (the array's length).
  const config = vesk.defaults('dtmf');
  const shown = Object.entries(config).flatMap(([key, value]) =>
    (value && typeof value === 'object' ? Object.keys(value).map((k) => `${key}.${k}`) : [key]));
  assert.deepEqual(shown.sort(), expected.config.filter((f) => f !== 'dtmf.num_tones').sort());
  assert.deepEqual(Object.keys(vesk.decoderDefaults()).sort(), expected.options.sort());
});

// vesk.d.ts declares what the module defines.
test('the type declarations name every method', () => {
  const types = readFileSync(new URL('../dist/vesk.d.ts', import.meta.url), 'utf8');
  const encoder = vesk.encoder();
  const decoder = vesk.decoder();
  for (const object of [vesk, encoder, decoder]) {
    for (const name of Object.getOwnPropertyNames(Object.getPrototypeOf(object))) {
      if (name === 'constructor') continue;
      assert.match(types, new RegExp(`\\b${name}[(:?]`), `${name} is not declared`);
    }
  }
  encoder.close();
  decoder.close();
});

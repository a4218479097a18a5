// Vesk for JavaScript: an ES module over the WebAssembly build of the C
// interface (src/vesk/vesk.h), for browsers and Node.js.
//
//   import { Vesk } from './vesk.js';
//   const vesk = await Vesk.load();
//   const encoder = vesk.encoder({ modem: 'dsss' });
//   const sent = encoder.encode(new Uint8Array([1, 2, 3, 4, 5, 6]));
//   // play sent.playback(3) at sent.sample_rate_hz
//   const decoder = vesk.decoder({ modem: 'dsss' }, {
//     microphone_rate_hz: audioContext.sampleRate,
//     onToken: (token) => console.log(token.message, token.time_seconds),
//   });
//   decoder.process(float32Samples);   // any chunk size, as often as audio arrives
//
// Configurations and options are plain objects with the field names of the
// C records (vesk_config, vesk_decoder_options); fields left out take the C
// defaults, and the C interface validates them, so refusals carry its
// sentences. Records handed back use the C names too. Objects that own
// WebAssembly memory (encoders, decoders) free it in close(); a closed object
// throws when used. Single-threaded: the module and its objects live on the
// thread that loaded it.
//
// scripts/build-web.sh appends this file to Emscripten's loader, which
// defines createVeskModule, to make dist/vesk.js.

/* global createVeskModule */

const MODEMS = Object.freeze({ dsss: 0, dtmf: 1 });
// Samples copied into WebAssembly memory per call into the decoder: the
// scratch buffer stays small whatever the caller hands in.
const PIECE_SAMPLES = 16384;

/** A failing call of the C interface: its status name and sentence. */
export class VeskError extends Error {
  constructor(status, message) {
    super(message);
    this.name = 'VeskError';
    /** The status name, such as 'VESK_ERROR_CONFIG'. */
    this.status = status;
  }
}

// Frees the C objects of encoders and decoders that were collected without
// close(): a backstop, not a substitute for close().
const finalizers = new FinalizationRegistry((release) => release());

// The loaded WebAssembly module: its functions, views of its memory, and the
// record layouts that vesk_web.cc describes.
class Runtime {
  constructor(module, memory) {
    this.m = module;
    this.memory = memory;
    this.buffer = null;
    // One scratch block for out-parameters; calls never nest.
    this.out = this.alloc(16);
    this.layout = JSON.parse(this.string(module._vesk_web_layout()));
  }

  views() {
    // Growing the memory replaces its buffer; the views follow it.
    if (this.buffer !== this.memory.buffer) {
      this.buffer = this.memory.buffer;
      this.u8 = new Uint8Array(this.buffer);
      this.i16 = new Int16Array(this.buffer);
      this.i32 = new Int32Array(this.buffer);
      this.u32 = new Uint32Array(this.buffer);
      this.f32 = new Float32Array(this.buffer);
      this.f64 = new Float64Array(this.buffer);
    }
    return this;
  }

  alloc(bytes) {
    const ptr = this.m._malloc(Math.max(bytes, 1));
    if (ptr === 0) throw new VeskError('VESK_ERROR_NO_MEMORY', 'out of memory');
    return ptr;
  }

  free(ptr) {
    this.m._free(ptr);
  }

  string(ptr) {
    const u8 = this.views().u8;
    let end = ptr;
    while (u8[end] !== 0) ++end;
    return new TextDecoder().decode(u8.subarray(ptr, end));
  }

  // Calls a vesk_* function and throws its sentence unless it returns VESK_OK.
  call(name, ...args) {
    const status = this.m[`_${name}`](...args);
    if (status !== 0) {
      throw new VeskError(
        this.string(this.m._vesk_status_name(status)),
        this.string(this.m._vesk_last_error()),
      );
    }
  }

  load(kind, address) {
    const v = this.views();
    switch (kind) {
      case 'i32':
        return v.i32[address >> 2];
      case 'ptr':
      case 'u32':
        return v.u32[address >> 2];
      case 'f32':
        return shortestFloat32(v.f32[address >> 2]);
      case 'f64':
        return v.f64[address >> 3];
    }
    throw new Error(`unknown field kind ${kind}`);
  }

  store(kind, address, value) {
    const v = this.views();
    switch (kind) {
      case 'i32':
        v.i32[address >> 2] = value;
        return;
      case 'ptr':
      case 'u32':
        v.u32[address >> 2] = value;
        return;
      case 'f32':
        v.f32[address >> 2] = value;
        return;
      case 'f64':
        v.f64[address >> 3] = value;
        return;
    }
    throw new Error(`unknown field kind ${kind}`);
  }

  // A record at `ptr` as an object; "dsss.x" fields become nested objects.
  read(record, ptr) {
    const object = {};
    for (const [name, offset, kind] of this.layout[record].fields) {
      const path = name.split('.');
      let target = object;
      for (const part of path.slice(0, -1)) target = target[part] ??= {};
      target[path[path.length - 1]] = this.load(kind, ptr + offset);
    }
    return object;
  }

  // Writes `object` (complete: every field present) as a record at `ptr`.
  write(record, ptr, object) {
    for (const [name, offset, kind] of this.layout[record].fields) {
      let value = object;
      for (const part of name.split('.')) value = value[part];
      this.store(kind, ptr + offset, value);
    }
  }
}

// The shortest decimal that is the same float32 as `x`: 0.005, not the
// 0.004999999888241291 that the float32 holds, and written back unchanged.
function shortestFloat32(x) {
  for (let digits = 1; digits < 9; ++digits) {
    const decimal = Number(x.toPrecision(digits));
    if (Math.fround(decimal) === x) return decimal;
  }
  return x;
}

function fieldNames(runtime, record) {
  return runtime.layout[record].fields.map(([name, , kind]) => [name, kind]);
}

// The value of JavaScript field `name` as the C field of `kind` holds it;
// a TypeError for values that C's type cannot hold as given.
function toField(name, kind, value) {
  if (typeof value === 'boolean') value = value ? 1 : 0;
  if (typeof value !== 'number') {
    throw new TypeError(`${name} must be a number, not ${typeof value}`);
  }
  if (kind === 'i32' && !(Number.isInteger(value) && value >= -(2 ** 31) && value < 2 ** 31)) {
    throw new TypeError(`${name} must be a 32-bit integer, not ${value}`);
  }
  return value;
}

// A complete configuration: the C defaults of its modem under the fields
// given. Unknown fields are refused, so that a misspelt one is not ignored.
function completeConfig(runtime, given = {}) {
  const modem = given.modem ?? 'dsss';
  if (!(modem in MODEMS)) throw new TypeError(`modem must be 'dsss' or 'dtmf', not ${modem}`);
  const config = readDefaults(runtime, modem);
  for (const [key, value] of Object.entries(given)) {
    if (key === 'modem') continue;
    if (key === 'dsss' || key === 'dtmf') {
      if (value != null && typeof value !== 'object') {
        throw new TypeError(`${key} must be an object of waveform fields`);
      }
      for (const [inner, innerValue] of Object.entries(value ?? {})) {
        if (!(inner in config[key])) throw new TypeError(`unknown field ${key}.${inner}`);
        config[key][inner] = innerValue;
      }
    } else if (key in config) {
      config[key] = value;
    } else {
      throw new TypeError(`unknown config field ${key}`);
    }
  }
  return config;
}

function readDefaults(runtime, modem) {
  const ptr = runtime.alloc(runtime.layout.config.size);
  try {
    runtime.call('vesk_config_defaults', ptr, MODEMS[modem]);
    const config = runtime.read('config', ptr);
    config.modem = modem;
    // The tone set is an array here; null is the default set.
    config.dtmf.tone_frequencies_hz = null;
    delete config.dtmf.num_tones;
    return config;
  } finally {
    runtime.free(ptr);
  }
}

// Writes `config` (complete) into C memory and calls `use(configPtr)`.
function withConfig(runtime, config, use) {
  const tones = config.dtmf.tone_frequencies_hz;
  if (tones != null && !(Array.isArray(tones) || ArrayBuffer.isView(tones))) {
    throw new TypeError('dtmf.tone_frequencies_hz must be an array of numbers or null');
  }
  const flat = { ...config, modem: MODEMS[config.modem], dsss: { ...config.dsss } };
  flat.dtmf = { ...config.dtmf, tone_frequencies_hz: 0, num_tones: tones ? tones.length : 0 };
  for (const [name, kind] of fieldNames(runtime, 'config')) {
    if (name === 'dtmf.tone_frequencies_hz') continue;
    const path = name.split('.');
    const holder = path.length === 1 ? flat : flat[path[0]];
    holder[path[path.length - 1]] = toField(name, kind, holder[path[path.length - 1]]);
  }
  const ptr = runtime.alloc(runtime.layout.config.size);
  let tonesPtr = 0;
  try {
    if (tones && tones.length > 0) {
      tonesPtr = runtime.alloc(tones.length * 4);
      tones.forEach((tone, i) => {
        const value = toField(`dtmf.tone_frequencies_hz[${i}]`, 'f32', tone);
        runtime.views().f32[(tonesPtr >> 2) + i] = value;
      });
      flat.dtmf.tone_frequencies_hz = tonesPtr;
    }
    runtime.write('config', ptr, flat);
    return use(ptr);
  } finally {
    if (tonesPtr) runtime.free(tonesPtr);
    runtime.free(ptr);
  }
}

function completeOptions(runtime, given = {}) {
  const ptr = runtime.alloc(runtime.layout.options.size);
  try {
    runtime.call('vesk_decoder_options_defaults', ptr);
    const options = runtime.read('options', ptr);
    for (const [key, value] of Object.entries(given)) {
      if (key === 'onToken') continue;
      if (!(key in options)) throw new TypeError(`unknown decoder option ${key}`);
      options[key] = value;
    }
    for (const [name, kind] of fieldNames(runtime, 'options')) {
      options[name] = toField(name, kind, options[name]);
    }
    return options;
  } finally {
    runtime.free(ptr);
  }
}

function toMessage(message) {
  if (message instanceof Uint8Array) return message;
  if (message instanceof ArrayBuffer) return new Uint8Array(message);
  if (ArrayBuffer.isView(message)) {
    return new Uint8Array(message.buffer, message.byteOffset, message.byteLength);
  }
  if (Array.isArray(message)) {
    for (const byte of message) {
      if (!(Number.isInteger(byte) && byte >= 0 && byte <= 255)) {
        throw new TypeError(`message bytes must be integers 0 to 255, not ${byte}`);
      }
    }
    return Uint8Array.from(message);
  }
  throw new TypeError('the message must be a Uint8Array, an ArrayBuffer or an array of bytes');
}

// Throws the C interface's answer for a destroyed object.
function closedError(what) {
  return new VeskError('VESK_ERROR_ARGUMENT', `the ${what} is closed`);
}

/**
 * Encoded audio: mono float samples in -1 ... 1 at sample_rate_hz, the
 * start transition (a fade-in, DSSS only) and one repetition of the token.
 */
class EncodedToken {
  constructor(transition, token, sampleRate) {
    this.transition = transition;
    this.token = token;
    this.sample_rate_hz = sampleRate;
  }

  /** The transition once, then the token `repetitions` times. */
  playback(repetitions = 1) {
    if (!(Number.isInteger(repetitions) && repetitions >= 1)) {
      throw new RangeError(`repetitions must be an integer >= 1, not ${repetitions}`);
    }
    const out = new Float32Array(this.transition.length + repetitions * this.token.length);
    out.set(this.transition);
    for (let r = 0; r < repetitions; ++r) {
      out.set(this.token, this.transition.length + r * this.token.length);
    }
    return out;
  }
}

class Encoder {
  #runtime;
  #ptr;
  #release;

  constructor(runtime, config) {
    this.#runtime = runtime;
    /** The complete configuration in use. */
    this.config = completeConfig(runtime, config);
    withConfig(runtime, this.config, (configPtr) => {
      runtime.call('vesk_encoder_create', configPtr, runtime.out);
      this.#ptr = runtime.views().u32[runtime.out >> 2];
    });
    const ptr = this.#ptr;
    this.#release = () => runtime.m._vesk_encoder_destroy(ptr);
    finalizers.register(this, this.#release, this);
  }

  /** Message bytes that encode() takes. */
  get messageBytes() {
    return this.config.message_bytes;
  }

  /** Encodes `message` (exactly messageBytes bytes) into an EncodedToken. */
  encode(message) {
    if (!this.#ptr) throw closedError('encoder');
    const bytes = toMessage(message);
    const rt = this.#runtime;
    const pcm = rt.alloc(rt.layout.pcm.size + bytes.length);
    const messagePtr = pcm + rt.layout.pcm.size;
    try {
      rt.views().u8.set(bytes, messagePtr);
      rt.call('vesk_encoder_encode', this.#ptr, messagePtr, bytes.length, pcm);
      const record = rt.read('pcm', pcm);
      const first = record.samples >> 1;
      const pcm16 = rt.views().i16.subarray(first, first + record.num_samples);
      const samples = new Float32Array(record.num_samples);
      for (let i = 0; i < samples.length; ++i) samples[i] = pcm16[i] / 32768;
      rt.m._vesk_pcm_free(pcm);
      return new EncodedToken(
        samples.subarray(0, record.transition_samples),
        samples.subarray(record.transition_samples),
        record.sample_rate_hz,
      );
    } finally {
      rt.free(pcm);
    }
  }

  /** Frees the encoder's WebAssembly memory; later calls throw. Idempotent. */
  close() {
    if (!this.#ptr) return;
    finalizers.unregister(this);
    this.#release();
    this.#ptr = 0;
  }
}

class Decoder {
  #runtime;
  #ptr;
  #scratch;
  #release;
  #undelivered = [];

  constructor(runtime, config, options = {}) {
    this.#runtime = runtime;
    /** The complete configuration and options in use. */
    this.config = completeConfig(runtime, config);
    this.options = completeOptions(runtime, options);
    /** Called with each token as process() decodes it; null: tokens() collects them. */
    this.onToken = options.onToken ?? null;
    this.#scratch = runtime.alloc(PIECE_SAMPLES * 4);
    const optionsPtr = runtime.alloc(runtime.layout.options.size);
    try {
      runtime.write('options', optionsPtr, this.options);
      withConfig(runtime, this.config, (configPtr) => {
        runtime.call('vesk_decoder_create', configPtr, optionsPtr, runtime.out);
        this.#ptr = runtime.views().u32[runtime.out >> 2];
      });
    } catch (error) {
      runtime.free(this.#scratch);
      throw error;
    } finally {
      runtime.free(optionsPtr);
    }
    const ptr = this.#ptr;
    const scratch = this.#scratch;
    this.#release = () => {
      runtime.m._vesk_decoder_destroy(ptr);
      runtime.free(scratch);
    };
    finalizers.register(this, this.#release, this);
  }

  #live() {
    if (!this.#ptr) throw closedError('decoder');
    return this.#runtime;
  }

  /**
   * Feeds interleaved samples: a Float32Array in -1 ... 1 (Web Audio's) or an
   * Int16Array of 16-bit PCM, in chunks of any size. With onToken set, the
   * tokens decoded are delivered before it returns.
   */
  process(samples) {
    const rt = this.#live();
    let fn;
    let shift;
    if (samples instanceof Float32Array) {
      fn = 'vesk_decoder_process_float';
      shift = 2;
    } else if (samples instanceof Int16Array) {
      fn = 'vesk_decoder_process';
      shift = 1;
    } else {
      throw new TypeError('samples must be a Float32Array or an Int16Array');
    }
    for (let start = 0; start < samples.length; start += PIECE_SAMPLES) {
      const piece = samples.subarray(start, start + PIECE_SAMPLES);
      (shift === 2 ? rt.views().f32 : rt.views().i16).set(piece, this.#scratch >> shift);
      rt.call(fn, this.#ptr, this.#scratch, piece.length);
    }
    if (this.onToken) this.#deliver();
  }

  /** Decodes the samples of an incomplete block now: the end of a recording. */
  flush() {
    this.#live().call('vesk_decoder_flush', this.#ptr);
    if (this.onToken) this.#deliver();
  }

  /**
   * Tokens decoded since the last call and not delivered to onToken, oldest
   * first: { message: Uint8Array, time_seconds } with the stream time of
   * the request that decoded each. A token is reported again only after it
   * went unheard for options.hold_seconds.
   */
  tokens() {
    const rt = this.#live();
    const out = rt.out;
    rt.call('vesk_decoder_take_tokens', this.#ptr, out, out + 4);
    const v = rt.views();
    const records = v.u32[out >> 2];
    const count = v.u32[(out + 4) >> 2];
    const taken = this.#undelivered;
    this.#undelivered = [];
    for (let i = 0; i < count; ++i) {
      const token = rt.read('token', records + i * rt.layout.token.size);
      taken.push({
        message: rt.views().u8.slice(token.message, token.message + token.message_bytes),
        time_seconds: token.time_seconds,
      });
    }
    return taken;
  }

  #deliver() {
    const pending = this.tokens();
    while (pending.length > 0) {
      const token = pending.shift();
      try {
        this.onToken(token);
      } catch (error) {
        // The rest wait for tokens() or the next delivery.
        this.#undelivered = pending.concat(this.#undelivered);
        throw error;
      }
    }
  }

  /** Whether a DSSS transmitter was audible at the latest request. */
  broadcasterDetected() {
    const rt = this.#live();
    rt.call('vesk_decoder_broadcaster', this.#ptr, rt.out);
    return rt.views().i32[rt.out >> 2] !== 0;
  }

  /** Seconds of audio fed so far. */
  streamSeconds() {
    const rt = this.#live();
    rt.call('vesk_decoder_stream_seconds', this.#ptr, rt.out);
    return rt.views().f64[rt.out >> 3];
  }

  /** Forgets the audio heard and which tokens were reported; queued tokens stay. */
  wipe() {
    this.#live().call('vesk_decoder_wipe', this.#ptr);
  }

  /** Frees the decoder's WebAssembly memory; later calls throw. Idempotent. */
  close() {
    if (!this.#ptr) return;
    finalizers.unregister(this);
    this.#release();
    this.#ptr = 0;
    this.#undelivered = [];
  }
}

/** A loaded Vesk: makes encoders and decoders. */
class VeskModule {
  #runtime;

  constructor(runtime) {
    this.#runtime = runtime;
    /** The library's version, "MAJOR.MINOR.PATCH". */
    this.version = runtime.string(runtime.m._vesk_version());
  }

  /** Bytes of WebAssembly memory that the module holds: it grows, never shrinks. */
  get memoryBytes() {
    return this.#runtime.memory.buffer.byteLength;
  }

  /** The complete default configuration of `modem` ('dsss' or 'dtmf'). */
  defaults(modem = 'dsss') {
    return completeConfig(this.#runtime, { modem });
  }

  /** The default decoder options. */
  decoderDefaults() {
    return completeOptions(this.#runtime, {});
  }

  /**
   * The lowest microphone rate, Hz, at which a decoder hears transmitters of
   * `config`: twice the DSSS carrier or the highest DTMF tone.
   */
  minMicrophoneRate(config) {
    const rt = this.#runtime;
    return withConfig(rt, completeConfig(rt, config), (configPtr) => {
      rt.call('vesk_config_min_microphone_rate', configPtr, rt.out);
      return rt.views().f32[rt.out >> 2];
    });
  }

  /** An encoder for `config` (fields left out take the modem's defaults). */
  encoder(config = {}) {
    return new Encoder(this.#runtime, config);
  }

  /**
   * A decoder for transmitters using `config`, listening as `options` say
   * (vesk_decoder_options fields, plus onToken).
   */
  decoder(config = {}, options = {}) {
    return new Decoder(this.#runtime, config, options);
  }
}

// The .wasm as bytes or a compiled module: fetched over HTTP(S), read from
// disk for file: URLs (Node.js), or given.
async function instantiate(source, imports) {
  if (source instanceof WebAssembly.Module) {
    return { instance: await WebAssembly.instantiate(source, imports), module: source };
  }
  if (source instanceof ArrayBuffer || ArrayBuffer.isView(source)) {
    return WebAssembly.instantiate(source, imports);
  }
  const url = new URL(source, import.meta.url);
  if (url.protocol === 'file:') {
    const { readFile } = await import('node:fs/promises');
    return WebAssembly.instantiate(await readFile(url), imports);
  }
  const response = await fetch(url);
  if (!response.ok) throw new Error(`cannot load ${url}: HTTP ${response.status}`);
  if (WebAssembly.instantiateStreaming) {
    try {
      return await WebAssembly.instantiateStreaming(response.clone(), imports);
    } catch (error) {
      // A server that does not send application/wasm: compile the bytes.
      if (!(error instanceof TypeError)) throw error;
    }
  }
  return WebAssembly.instantiate(await response.arrayBuffer(), imports);
}

export const Vesk = Object.freeze({
  /**
   * Loads the WebAssembly module. Options: wasm, where vesk.wasm is (a URL,
   * default next to this file; or its bytes; or a WebAssembly.Module); log,
   * a function given each log line of the library (default console.warn).
   */
  async load({ wasm = 'vesk.wasm', log = (line) => console.warn(line) } = {}) {
    let memory = null;
    const module = await new Promise((resolve, reject) => {
      createVeskModule({
        // The loader waits for receive(); a failed load rejects here instead.
        instantiateWasm(imports, receive) {
          instantiate(wasm, imports).then(({ instance, module: compiled }) => {
            memory = Object.values(instance.exports).find((e) => e instanceof WebAssembly.Memory);
            receive(instance, compiled);
          }, reject);
          return {};
        },
        print: log,
        printErr: log,
      }).then(resolve, reject);
    });
    return new VeskModule(new Runtime(module, memory));
  },
});

export default Vesk;

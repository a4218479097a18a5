// Types of vesk.js, the ES module over the WebAssembly build of Vesk. Field
// names, units and defaults are those of the C records in vesk/vesk.h; the
// C interface validates every value and its sentences reach VeskError.

export type Modem = 'dsss' | 'dtmf';

/** The DSSS waveform (vesk_dsss_waveform). Defaults in parentheses. */
export interface DsssWaveform {
  number_of_taps: number; // PN code register length, 5 to 11 (7).
  code_number: number; // 0 to 2 for 5 or 6 taps, else 0 to 3 (0).
  coder_sample_rate_hz: number; // Rate the symbols are made at (48000).
  upsampling_factor: number; // Coder samples per chip (16).
  baseband_decimation_factor: number; // Divides upsampling_factor (4).
  carrier_frequency_hz: number; // (0, coder rate / 2] (18500).
  bits_per_symbol: number; // 1, 2, 4 or 8 (4).
  min_cycles_per_frame: number; // Lowest symbol tone, carrier cycles per frame (4).
  quadrature_carrier: number | boolean; // Symbol tones on the cosine carrier (0).
  /** Transmitter only: keep only the upper sideband (0). */
  single_sideband: number | boolean;
  /** Transmitter only: rate of the encoded audio (48000). */
  broadcast_sample_rate_hz: number;
  /** Transmitter only: fade-in before the token, seconds (0.005). */
  transition_seconds: number;
}

/** The DTMF waveform (vesk_dtmf_waveform). */
export interface DtmfWaveform {
  sample_rate_hz: number; // Rate of the encoded audio (44100).
  baseband_decimation_factor: number; // (16).
  window_seconds: number; // Nominal symbol duration (0.05).
  tones_per_symbol: number; // Tones sounding together (2).
  attack_seconds: number; // Envelope segments, seconds (0.025, 0, 0, 0.025).
  decay_seconds: number;
  sustain_seconds: number;
  release_seconds: number;
  sustain_level: number; // In [0, 1] (1).
  /** The tone set, Hz; null is the default ten tones from 740 to 2489 Hz. */
  tone_frequencies_hz: ArrayLike<number> | null;
}

/** A modem and its token layout (vesk_config); defaults depend on the modem. */
export interface Config {
  modem: Modem;
  message_bytes: number; // Message bytes per token (DSSS 6, DTMF 5).
  crc_check_bytes: number; // 0 or 2 (DSSS 2, DTMF 0).
  checksum_symbol: number | boolean; // (DSSS 0, DTMF 1).
  dsss: DsssWaveform;
  dtmf: DtmfWaveform;
}

/** Any part of a Config: what is left out takes the modem's defaults. */
export interface ConfigInput {
  modem?: Modem;
  message_bytes?: number;
  crc_check_bytes?: number;
  checksum_symbol?: number | boolean;
  dsss?: Partial<DsssWaveform>;
  dtmf?: Partial<DtmfWaveform>;
}

/** How a decoder listens (vesk_decoder_options). */
export interface DecoderOptions {
  microphone_rate_hz: number; // >= 1000 (44100); see minMicrophoneRate().
  channels: number; // Interleaved channels fed (1).
  listening_mode: number | boolean; // DSSS: the cheap detector wakes the decoder (0).
  max_tokens_per_call: number; // Tokens decoded per request, 1 to 6 (2).
  buffer_length_tokens: number; // History held, token durations (4).
  acquisition_window_seconds: number; // DSSS (0.75).
  broadcaster_threshold: number; // DSSS (5).
  design_baseband_filter: number | boolean; // DSSS (0).
  poll_interval_seconds: number; // Stream time between requests, (0, 1] (0.25).
  /** A token is reported again only after it went unheard this long, seconds; 0: every time (3). */
  hold_seconds: number;
  /** Notch steady tones in the modem's band out of the input; not in the listening mode (1). */
  narrowband_excision: number | boolean;
}

export interface DecoderOptionsInput extends Partial<DecoderOptions> {
  /** Called with each token as process() decodes it. */
  onToken?: ((token: Token) => void) | null;
}

/** A token heard (vesk_token). */
export interface Token {
  /** Message bytes, check bytes verified and removed. */
  message: Uint8Array;
  /** Stream time (seconds of audio fed) of the request that decoded it. */
  time_seconds: number;
}

/** Encoded audio: mono samples in -1 ... 1 at sample_rate_hz. */
export interface EncodedToken {
  /** The fade-in to play once before the first token (empty for DTMF). */
  readonly transition: Float32Array;
  /** One repetition of the token. */
  readonly token: Float32Array;
  /** The broadcast rate (DSSS) or the DTMF rate, Hz. */
  readonly sample_rate_hz: number;
  /** The transition, then the token `repetitions` (>= 1, default 1) times. */
  playback(repetitions?: number): Float32Array;
}

export interface Encoder {
  /** The complete configuration in use. */
  readonly config: Config;
  /** Bytes that encode() takes. */
  readonly messageBytes: number;
  /** Encodes exactly messageBytes bytes; VeskError otherwise. */
  encode(message: Uint8Array | ArrayBuffer | ArrayLike<number>): EncodedToken;
  /** Frees the encoder's WebAssembly memory; later calls throw. Idempotent. */
  close(): void;
}

export interface Decoder {
  readonly config: Config;
  readonly options: DecoderOptions;
  /** Called with each token as process() decodes it; null: tokens() collects them. */
  onToken: ((token: Token) => void) | null;
  /**
   * Feeds interleaved samples, Float32 in -1 ... 1 or 16-bit PCM, in chunks of
   * any size; the same audio gives the same tokens however it is chunked.
   */
  process(samples: Float32Array | Int16Array): void;
  /** Decodes the samples of an incomplete block now (end of a recording). */
  flush(): void;
  /** Tokens decoded since the last call and not given to onToken, oldest first. */
  tokens(): Token[];
  /** Whether a DSSS transmitter was audible at the latest request. */
  broadcasterDetected(): boolean;
  /** Seconds of audio fed so far. */
  streamSeconds(): number;
  /** Forgets the audio heard and which tokens were reported. */
  wipe(): void;
  /** Frees the decoder's WebAssembly memory; later calls throw. Idempotent. */
  close(): void;
}

export interface VeskModule {
  /** The library's version, "MAJOR.MINOR.PATCH". */
  readonly version: string;
  /** Bytes of WebAssembly memory that the module holds: it grows, never shrinks. */
  readonly memoryBytes: number;
  /** The complete default configuration of a modem (default 'dsss'). */
  defaults(modem?: Modem): Config;
  decoderDefaults(): DecoderOptions;
  /** The lowest microphone rate, Hz, that hears transmitters of `config`. */
  minMicrophoneRate(config?: ConfigInput): number;
  encoder(config?: ConfigInput): Encoder;
  decoder(config?: ConfigInput, options?: DecoderOptionsInput): Decoder;
}

export interface LoadOptions {
  /** vesk.wasm: a URL (default: next to vesk.js), its bytes, or a compiled module. */
  wasm?: string | URL | ArrayBuffer | ArrayBufferView | WebAssembly.Module;
  /** Receives each log line of the library (default console.warn). */
  log?: (line: string) => void;
}

/** A failing call of the C interface. */
export class VeskError extends Error {
  /** The status name, such as 'VESK_ERROR_CONFIG'. */
  readonly status: string;
}

export const Vesk: {
  load(options?: LoadOptions): Promise<VeskModule>;
};
export default Vesk;

// The Vesk page: sends a message through the loudspeaker and listens through
// the microphone, with the WebAssembly module that scripts/build-web.sh puts
// in dist/. No build step of its own: serve web/ over HTTP from localhost (or
// over HTTPS), as the microphone needs a secure page.
//
// Sending: the module encodes the message, Web Audio plays it from a buffer
// at the modem's own rate, through the volume and a tap that measures what
// was played. Listening: an AudioWorklet hands the microphone's samples to
// the page in chunks, the decoder reports tokens as they are heard, and an
// AnalyserNode feeds the level meter and the spectrogram.

const $ = (id) => document.getElementById(id);

const SPECTROGRAM_TOP_HZ = 24000;
const LEVEL_FLOOR_DB = -90;
const NAMES = { dsss: 'DSSS', dtmf: 'DTMF' };

let vesk = null;
let output = null; // The sending context, its volume and its tap.
let listening = null; // What a listening session holds; null when not listening.

function modem() {
  return document.querySelector('input[name=modem]:checked').value;
}

function show(id, text, isError = false) {
  const element = $(id);
  element.textContent = text;
  element.classList.toggle('error', isError);
}

function decibels(peak) {
  return peak > 0 ? Math.max(LEVEL_FLOOR_DB, 20 * Math.log10(peak)) : LEVEL_FLOOR_DB;
}

function peakOf(samples) {
  let peak = 0;
  for (const s of samples) peak = Math.max(peak, Math.abs(s));
  return peak;
}

async function loadModule() {
  try {
    const { Vesk } = await import('./dist/vesk.js');
    vesk = await Vesk.load({ log: (line) => console.info(line) });
  } catch (error) {
    show('module-status', `The modem could not be loaded (${error.message}). Build it with ` +
         'scripts/build-web.sh and serve web/ over HTTP.', true);
    return;
  }
  show('module-status', `Vesk ${vesk.version}, running in WebAssembly.`);
  $('send-button').disabled = false;
  $('listen-button').disabled = false;
  updateHint();
}

// ---------------------------------------------------------------- Sending

function tokenBytes() {
  return vesk.defaults(modem()).message_bytes;
}

function updateHint() {
  if (vesk) {
    show('message-hint', `${tokenBytes()} bytes per ${NAMES[modem()]} token; ` +
         'a shorter message is padded with zeros.');
  }
}

// The message as token bytes, or an Error saying why it cannot be sent.
function messageBytes() {
  const size = tokenBytes();
  const typed = $('message').value;
  let bytes;
  if ($('format').value === 'hex') {
    const digits = typed.replace(/\s+/g, '');
    if (!/^([0-9a-fA-F]{2})*$/.test(digits)) {
      throw new Error('Hex needs pairs of the digits 0-9 and a-f.');
    }
    bytes = Uint8Array.from(digits.match(/../g) ?? [], (pair) => parseInt(pair, 16));
  } else {
    bytes = new TextEncoder().encode(typed);
  }
  if (bytes.length > size) {
    throw new Error(`A ${NAMES[modem()]} token carries ${size} bytes; this message has ` +
                    `${bytes.length}.`);
  }
  const padded = new Uint8Array(size);
  padded.set(bytes);
  return padded;
}

function makeOutput() {
  const context = new AudioContext();
  const volume = context.createGain();
  // The tap: what reaches the loudspeaker, measured while a token plays.
  const tap = context.createAnalyser();
  tap.fftSize = 2048;
  volume.connect(tap);
  tap.connect(context.destination);
  return { context, volume, tap };
}

async function send() {
  let message;
  try {
    message = messageBytes();
  } catch (error) {
    show('send-status', error.message, true);
    return;
  }
  const encoder = vesk.encoder({ modem: modem() });
  let token;
  try {
    token = encoder.encode(message);
  } finally {
    encoder.close();
  }
  const repeat = Math.min(20, Math.max(1, Math.round(Number($('repeat').value)) || 1));
  const samples = token.playback(repeat);

  output ??= makeOutput();
  const { context, volume, tap } = output;
  await context.resume();
  // Web Audio converts the modem's rate to the context's.
  const buffer = context.createBuffer(1, samples.length, token.sample_rate_hz);
  buffer.copyToChannel(samples, 0);
  const source = context.createBufferSource();
  source.buffer = buffer;
  volume.gain.value = Number($('volume').value) / 100;
  source.connect(volume);

  const seconds = samples.length / token.sample_rate_hz;
  const hex = Array.from(message, (b) => b.toString(16).padStart(2, '0')).join('');
  show('send-status', `Sending ${hex} (${NAMES[modem()]}), ${repeat} × ` +
       `${(token.token.length / token.sample_rate_hz).toFixed(2)} s…`);
  const frame = new Float32Array(tap.fftSize);
  let peak = 0;
  const watch = setInterval(() => {
    tap.getFloatTimeDomainData(frame);
    peak = Math.max(peak, peakOf(frame));
  }, 20);
  source.onended = () => {
    clearInterval(watch);
    $('send-status').dataset.peak = String(peak);
    show('send-status', `Sent ${hex} (${NAMES[modem()]}), ${seconds.toFixed(2)} s at ` +
         `${token.sample_rate_hz} Hz; played at ${decibels(peak).toFixed(1)} dBFS peak.`);
  };
  source.start();
}

// -------------------------------------------------------------- Listening

function microphoneError(error) {
  switch (error.name) {
    case 'NotAllowedError':
    case 'SecurityError':
      return 'The microphone was refused. Allow it for this page (in the address bar or the ' +
             "site's settings) and press Listen again.";
    case 'NotFoundError':
      return 'No microphone was found.';
    case 'NotReadableError':
      return 'The microphone is in use by another program or could not be opened.';
    default:
      return `The microphone could not be opened: ${error.message}`;
  }
}

async function listen() {
  if (listening) {
    stopListening('Stopped.');
    return;
  }
  const config = { modem: modem() };
  if (!navigator.mediaDevices?.getUserMedia) {
    show('listen-status', 'This page needs a secure origin for the microphone: open it from ' +
         'http://localhost or over HTTPS.', true);
    return;
  }
  // One start at a time: the button waits for the microphone's answer.
  $('listen-button').disabled = true;
  try {
    let stream;
    try {
      stream = await navigator.mediaDevices.getUserMedia({
        audio: { echoCancellation: false, noiseSuppression: false, autoGainControl: false,
                 channelCount: 1 },
      });
    } catch (error) {
      show('listen-status', microphoneError(error), true);
      return;
    }
    const session = { stream, context: null, decoder: null, frame: 0 };
    try {
      await startSession(session, config);
    } catch (error) {
      endSession(session);
      show('listen-status', `Listening failed: ${error.message}`, true);
    }
  } finally {
    $('listen-button').disabled = false;
  }
}

async function startSession(session, config) {
  const trackRate = session.stream.getAudioTracks()[0]?.getSettings().sampleRate;
  session.context = new AudioContext();
  let source;
  try {
    source = session.context.createMediaStreamSource(session.stream);
  } catch (error) {
    // Firefox connects a microphone only to a context at the microphone's rate.
    if (!trackRate) throw error;
    await session.context.close();
    session.context = new AudioContext({ sampleRate: trackRate });
    source = session.context.createMediaStreamSource(session.stream);
  }
  const { context } = session;
  // A microphone slower than the context is upsampled: its own rate decides.
  const rate = Math.min(context.sampleRate, trackRate || Infinity);
  const needed = vesk.minMicrophoneRate(config);
  if (rate < needed) {
    endSession(session);
    show('listen-status', `The microphone delivers ${rate} Hz, too low for ` +
         `${NAMES[config.modem]}, which needs at least ${Math.ceil(needed)} Hz. ` +
         (config.modem === 'dsss' ? 'Choose DTMF, or use another microphone.' :
           'Use another microphone.'), true);
    return;
  }

  await context.audioWorklet.addModule(new URL('capture-worklet.js', import.meta.url));
  session.decoder = vesk.decoder(config, {
    microphone_rate_hz: Math.round(context.sampleRate),
    onToken: addToken,
  });
  const capture = new AudioWorkletNode(context, 'vesk-capture');
  capture.port.onmessage = ({ data }) => heard(session, data);
  source.connect(capture);
  // Connected so that every browser runs it; it outputs silence.
  capture.connect(context.destination);
  session.analyser = context.createAnalyser();
  session.analyser.fftSize = 2048;
  session.analyser.smoothingTimeConstant = 0;
  source.connect(session.analyser);
  await context.resume();

  listening = session;
  $('listen-button').textContent = 'Stop';
  show('listen-status', `Listening for ${NAMES[config.modem]} at ${context.sampleRate} Hz.`);
  drawAxis(context.sampleRate / 2);
  session.frame = requestAnimationFrame(drawSpectrogram);
}

// A chunk of microphone samples from the worklet.
function heard(session, samples) {
  if (listening !== session) return;
  session.decoder.process(samples);
  // The meter holds peaks and falls back at about 30 dB per second.
  const fall = (30 * samples.length) / session.context.sampleRate;
  const level = Math.max(decibels(peakOf(samples)), (session.level ?? LEVEL_FLOOR_DB) - fall);
  session.level = level;
  $('level').value = level;
  $('level-text').textContent = `${Math.round(level) || 0} dBFS`;
  if (session.decoder.config.modem === 'dsss') {
    $('broadcaster').textContent = session.decoder.broadcasterDetected() ?
      'transmitter heard' : '';
  }
}

function addToken(token) {
  const hex = Array.from(token.message, (b) => b.toString(16).padStart(2, '0')).join('');
  // Text too, when the bytes are printable ASCII (trailing zeros are padding).
  let end = token.message.length;
  while (end > 0 && token.message[end - 1] === 0) --end;
  const bytes = token.message.subarray(0, end);
  const text = bytes.length > 0 && bytes.every((b) => b >= 0x20 && b < 0x7f) ?
    ` "${String.fromCharCode(...bytes)}"` : '';
  const item = document.createElement('li');
  const time = document.createElement('span');
  time.className = 'time';
  time.textContent = `${token.time_seconds.toFixed(2)} s`;
  item.append(time, `${hex}${text}`);
  $('tokens').prepend(item);
}

function endSession(session) {
  cancelAnimationFrame(session.frame);
  for (const track of session.stream.getTracks()) track.stop();
  session.context?.close();
  session.decoder?.close();
}

function stopListening(message) {
  if (!listening) return;
  endSession(listening);
  listening = null;
  $('listen-button').textContent = 'Listen';
  $('level').value = LEVEL_FLOOR_DB;
  $('level-text').textContent = '–';
  $('broadcaster').textContent = '';
  show('listen-status', message);
}

// ------------------------------------------------------------ Spectrogram

// 256 colours for the levels 0 ... 255: black, blue, magenta, orange, white.
const STOPS = [[0, 0, 0], [0, 0, 160], [200, 0, 120], [255, 180, 0], [255, 255, 255]];
const PALETTE = Array.from({ length: 256 }, (_, i) => {
  const x = (i / 255) * (STOPS.length - 1);
  const k = Math.min(STOPS.length - 2, Math.floor(x));
  return STOPS[k].map((c, j) => Math.round(c + (x - k) * (STOPS[k + 1][j] - c)));
});
const ABOVE_NYQUIST = [40, 40, 48];

function drawAxis(nyquist) {
  const axis = $('axis');
  axis.replaceChildren();
  for (let khz = 0; khz <= SPECTROGRAM_TOP_HZ / 1000; khz += 4) {
    const label = document.createElement('span');
    label.style.top = `${100 * (1 - (khz * 1000) / SPECTROGRAM_TOP_HZ)}%`;
    label.textContent = `${khz} kHz`;
    axis.append(label);
  }
  axis.title = `Frequencies above ${(nyquist / 1000).toFixed(2)} kHz are beyond this microphone.`;
}

// Scrolls the spectrogram one column left and draws the newest spectrum,
// 0 Hz at the bottom and 24 kHz at the top, at the right edge.
function drawSpectrogram() {
  const session = listening;
  if (!session) return;
  const canvas = $('spectrogram');
  const g = canvas.getContext('2d');
  const { width, height } = canvas;
  const bins = (session.bins ??= new Uint8Array(session.analyser.frequencyBinCount));
  session.analyser.getByteFrequencyData(bins);
  const nyquist = session.context.sampleRate / 2;
  const column = (session.column ??= g.createImageData(1, height));
  for (let y = 0; y < height; ++y) {
    const frequency = (1 - (y + 0.5) / height) * SPECTROGRAM_TOP_HZ;
    const colour = frequency >= nyquist ? ABOVE_NYQUIST :
      PALETTE[bins[Math.floor((frequency / nyquist) * bins.length)]];
    column.data.set(colour, 4 * y);
    column.data[4 * y + 3] = 255;
  }
  g.drawImage(canvas, -1, 0);
  g.putImageData(column, width - 1, 0);
  session.frame = requestAnimationFrame(drawSpectrogram);
}

// ------------------------------------------------------------------ Wiring

$('send-button').addEventListener('click', send);
$('listen-button').addEventListener('click', listen);
for (const radio of document.querySelectorAll('input[name=modem]')) {
  radio.addEventListener('change', () => {
    updateHint();
    stopListening('Stopped: the modem changed. Press Listen to listen for it.');
  });
}
loadModule();

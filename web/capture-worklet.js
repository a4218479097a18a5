// The page's microphone tap, on the audio rendering thread: collects the
// first input channel into chunks of CHUNK_FRAMES frames and posts each to
// the page, which decodes it. Decoding stays on the page (it takes about a
// hundredth of real time), so this thread only copies.

const CHUNK_FRAMES = 2048; // About 43 ms at 48 kHz: 16 render quanta.

class VeskCapture extends AudioWorkletProcessor {
  constructor() {
    super();
    this.chunk = new Float32Array(CHUNK_FRAMES);
    this.filled = 0;
  }

  process(inputs) {
    const channel = inputs[0] && inputs[0][0];
    if (channel) {
      let read = 0;
      while (read < channel.length) {
        const n = Math.min(channel.length - read, CHUNK_FRAMES - this.filled);
        this.chunk.set(channel.subarray(read, read + n), this.filled);
        this.filled += n;
        read += n;
        if (this.filled === CHUNK_FRAMES) {
          // The buffer moves to the page; a fresh one takes its place.
          this.port.postMessage(this.chunk, [this.chunk.buffer]);
          this.chunk = new Float32Array(CHUNK_FRAMES);
          this.filled = 0;
        }
      }
    }
    return true;
  }
}

registerProcessor('vesk-capture', VeskCapture);

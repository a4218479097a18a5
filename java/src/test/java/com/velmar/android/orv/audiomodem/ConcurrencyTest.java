package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.ArrayList;
import java.util.List;
import java.util.Random;
import java.util.Set;
import java.util.concurrent.Callable;
import java.util.concurrent.ConcurrentHashMap;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import java.util.concurrent.TimeUnit;
import java.util.concurrent.atomic.AtomicBoolean;
import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.Test;

/**
 * Decoders used from several threads at once through the real library, while other threads create
 * and close decoders, re-create the encoder and close a decoder under its user's feet: every
 * decoder hears exactly its own transmission, ids come back, and misuse is a clear exception.
 */
class ConcurrencyTest {
  private static final int FEEDERS = 4;
  private static final int ROUNDS = 3; // Decoders each feeder makes, one after the other.

  /** A transmitter, a receiver and what it must hear. */
  private static final class Link {
    final byte[] message;
    final DecoderOptions options;
    final DsssConfig dsss; // Null for DTMF.
    final DtmfConfig dtmf;
    final byte[] tokenAudio; // What its encoder makes of the message.
    final short[] input;

    Link(int seed, DsssConfig dsss, DtmfConfig dtmf, DecoderOptions options) {
      message = new byte[dsss != null ? dsss.messageBytes() : dtmf.messageBytes()];
      new Random(seed).nextBytes(message);
      this.dsss = dsss;
      this.dtmf = dtmf;
      this.options = options;
      try (TokenEncoder encoder = encoder()) {
        tokenAudio = encoder.encode(message).tokenAudio();
      }
      input = dsss != null ? TokenDecoderTest.transmission(dsss, message, options.channels(), seed)
                           : DtmfTest.transmission(dtmf, message, options.channels(), seed);
    }

    TokenEncoder encoder() {
      return dsss != null ? TokenEncoder.create(dsss) : TokenEncoder.create(dtmf);
    }

    TokenDecoder decoder() {
      return dsss != null ? TokenDecoder.create(dsss, options) : TokenDecoder.create(dtmf, options);
    }
  }

  @Test
  void decodersHearOnlyTheirOwnWhileOthersChurn() throws Exception {
    int idsBefore = TokenDecoder.idsInUse();
    DecoderOptions mono = DecoderOptions.builder().microphoneRate(48000).build();
    DecoderOptions stereo = DecoderOptions.builder().microphoneRate(48000).channels(2).build();
    DecoderOptions listening =
        DecoderOptions.builder().microphoneRate(48000).channels(3).listeningMode(true).build();
    Link[] links = {new Link(1, DsssConfig.defaults(), null, mono),
        new Link(2, DsssConfig.builder().coder44100().build(), null, stereo),
        new Link(3, DsssConfig.defaults(), null, listening),
        new Link(4, null, DtmfConfig.builder().sampleRate(48000f).build(), stereo)};

    ExecutorService pool = Executors.newFixedThreadPool(FEEDERS + 3);
    Set<Integer> ids = ConcurrentHashMap.newKeySet();
    AtomicInteger feedersLeft = new AtomicInteger(FEEDERS);
    List<Future<?>> work = new ArrayList<>();
    for (Link link : links) {
      work.add(pool.submit(() -> {
        try {
          for (int round = 0; round < ROUNDS; round++) {
            hearsItsOwn(link, ids, new Random(round));
          }
        } finally {
          feedersLeft.decrementAndGet();
        }
        return null;
      }));
    }
    // Churn: decoders of every kind made, fed a little, asked and closed, two alive at times.
    work.add(pool.submit(() -> {
      Random random = new Random(5);
      while (feedersLeft.get() > 0) {
        Link link = links[random.nextInt(links.length)];
        try (TokenDecoder first = link.decoder(); TokenDecoder second = link.decoder()) {
          ids.add(first.id());
          ids.add(second.id());
          first.process(link.input, 0, 4800 * link.options.channels());
          second.tokens();
          first.wipe();
          second.maxSafeInputSamples();
        }
      }
      return null;
    }));
    // The encoder re-created again and again, alternating the modems: each makes the same audio
    // as before the threads started.
    work.add(pool.submit(() -> {
      int made = 0;
      while (feedersLeft.get() > 0) {
        Link link = links[made++ % links.length];
        try (TokenEncoder encoder = link.encoder()) {
          assertArrayEquals(link.tokenAudio, encoder.encode(link.message).tokenAudio());
        }
      }
      return null;
    }));
    // A decoder closed while another thread uses it: its user sees IllegalStateException.
    TokenDecoder victim = links[0].decoder();
    ids.add(victim.id());
    CountDownLatch using = new CountDownLatch(1);
    Future<Integer> user = pool.submit((Callable<Integer>) () -> {
      int calls = 0;
      try {
        while (true) {
          victim.process(links[0].input, 0, 2400);
          victim.tokens();
          calls++;
          using.countDown();
        }
      } catch (IllegalStateException expected) {
        assertEquals("decoder is closed", expected.getMessage());
        return calls;
      }
    });
    assertTrue(using.await(60, TimeUnit.SECONDS));
    victim.close();
    assertTrue(user.get() > 0);

    for (Future<?> future : work) {
      future.get(300, TimeUnit.SECONDS); // Rethrows what failed on its thread.
    }
    pool.shutdown();
    assertTrue(pool.awaitTermination(60, TimeUnit.SECONDS));
    // Ids are reused: never more than could be alive at once (the feeders, the churn's two and
    // the victim, beyond what other tests hold).
    assertEquals(idsBefore, TokenDecoder.idsInUse());
    int mostAlive = FEEDERS + 2 + 1;
    assertTrue(ids.stream().allMatch(id -> id < idsBefore + mostAlive), ids.toString());
  }

  // Feeds the link's input in pieces of random whole frames, asking for tokens between them: the
  // decoder must hear the link's message and nothing else.
  private static void hearsItsOwn(Link link, Set<Integer> ids, Random random) {
    int channels = link.options.channels();
    List<byte[]> heard = new ArrayList<>();
    try (TokenDecoder decoder = link.decoder()) {
      ids.add(decoder.id());
      for (int at = 0; at < link.input.length;) {
        int count = Math.min(link.input.length - at, channels * (1 + random.nextInt(6000)));
        decoder.process(link.input, at, count);
        at += count;
        if (random.nextInt(8) == 0) {
          heard.addAll(decoder.tokens());
        }
      }
      heard.addAll(decoder.tokens());
    }
    assertFalse(heard.isEmpty(), link.options + " heard nothing");
    for (byte[] token : heard) {
      assertArrayEquals(link.message, token);
    }
  }
}

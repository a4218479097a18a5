package com.velmar.android.orv.shrinktest;

import com.velmar.android.orv.audiomodem.DecoderOptions;
import com.velmar.android.orv.audiomodem.DsssConfig;
import com.velmar.android.orv.audiomodem.DtmfConfig;
import com.velmar.android.orv.audiomodem.EncodedToken;
import com.velmar.android.orv.audiomodem.Token;
import com.velmar.android.orv.audiomodem.TokenDecoder;
import com.velmar.android.orv.audiomodem.TokenEncoder;
import com.velmar.android.orv.audiomodem.TokenListener;
import com.velmar.android.orv.audiomodem.TokenStream;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;

/**
 * An app that uses the library's public API only, run after ProGuard shrank and obfuscated both
 * together: encodes tokens and hears them back through a token stream, for the DSSS modem, its
 * listening mode and the DTMF modem. Exits with status 0 when each loopback reports its token
 * exactly once; a lost native method ends it with UnsatisfiedLinkError, a lost callback with no
 * token.
 */
public final class ShrinkTestApp {
  private static final int RATE = 48000;

  private ShrinkTestApp() {}

  public static void main(String[] args) {
    // Unrenamed library classes would prove nothing about the rules.
    check(!TokenStream.class.getName().endsWith(".TokenStream"),
        "the library was not obfuscated: " + TokenStream.class.getName());

    byte[] message = {0x12, 0x34, 0x56, 0x78, (byte) 0x9A, (byte) 0xBC};
    DsssConfig dsss = DsssConfig.defaults();
    EncodedToken dsssToken;
    try (TokenEncoder encoder = TokenEncoder.create(dsss)) {
      dsssToken = encoder.encode(message);
    }
    DecoderOptions options = DecoderOptions.builder().microphoneRate(RATE).build();
    loopback("DSSS", TokenDecoder.create(dsss, options), dsssToken, message, true);
    DecoderOptions listening =
        DecoderOptions.builder().microphoneRate(RATE).listeningMode(true).build();
    loopback("listening mode", TokenDecoder.create(dsss, listening), dsssToken, message, true);

    byte[] dtmfMessage = Arrays.copyOf(message, 5);
    DtmfConfig dtmf = DtmfConfig.builder().sampleRate(RATE).build();
    try (TokenEncoder encoder = TokenEncoder.create(dtmf)) {
      loopback("DTMF", TokenDecoder.create(dtmf, options), encoder.encode(dtmfMessage), dtmfMessage,
          false);
    }
    System.out.println("shrunk app: every loopback heard its token once");
  }

  // Feeds one second of silence, the token three times and three seconds of silence in reads of
  // 20 ms, as a recording loop would.
  private static void loopback(
      String name, TokenDecoder decoder, EncodedToken token, byte[] message, boolean dsss) {
    List<Token> tokens = new ArrayList<>();
    List<Boolean> broadcaster = new ArrayList<>();
    TokenListener listener = new TokenListener() {
      @Override
      public void onToken(Token heard) {
        tokens.add(heard);
      }

      @Override
      public void onBroadcaster(boolean heard) {
        broadcaster.add(heard);
      }
    };
    short[] audio = EncodedToken.toSamples(token.playback(3));
    short[] input = new short[RATE + audio.length + 3 * RATE];
    System.arraycopy(audio, 0, input, RATE, audio.length);
    try (TokenStream stream = TokenStream.create(decoder, listener)) {
      short[] buffer = new short[RATE / 50];
      for (int start = 0; start < input.length; start += buffer.length) {
        int count = Math.min(buffer.length, input.length - start);
        System.arraycopy(input, start, buffer, 0, count);
        stream.feed(buffer, count);
      }
    }
    check(tokens.size() == 1, name + ": heard " + tokens);
    check(Arrays.equals(message, tokens.get(0).message()), name + ": heard " + tokens);
    check(broadcaster.equals(dsss ? Arrays.asList(true, false) : new ArrayList<Boolean>()),
        name + ": broadcaster " + broadcaster);
  }

  private static void check(boolean condition, String failure) {
    if (!condition) {
      System.err.println("shrunk app: " + failure);
      System.exit(1);
    }
  }
}

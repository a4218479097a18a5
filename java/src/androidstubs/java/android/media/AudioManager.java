package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AudioManager {
  public static final String PROPERTY_SUPPORT_AUDIO_SOURCE_UNPROCESSED =
      "android.media.property.SUPPORT_AUDIO_SOURCE_UNPROCESSED";

  public String getProperty(String key) {
    throw new RuntimeException("Stub!");
  }
}

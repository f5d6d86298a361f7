package kestrel.tests;

import static kestrel.tests.Pictures.convert;

import android.graphics.Bitmap;
import android.graphics.BitmapProbe;

/** Failures of everything that the natives call. {@link Main} sees to it that nothing leaks. */
final class Failures {
  private static final int TABLE_TO_NV21 = 8192;
  private static final int TABLE_TO_RGB = 4352;

  private Failures() {}

  static void requestsOfMemoryFromABitmap() {
    Bitmap bitmap = Pictures.paint(20, 10, Pictures::patches);
    failEveryRequest(() -> convert(bitmap), TABLE_TO_NV21);
    Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held");
  }

  static void requestsOfMemoryToABitmap() {
    byte[] data = Pictures.nv21(20, 10, Pictures::patches);
    failEveryRequest(() -> convert(data, 20, 10, 40, 20), TABLE_TO_RGB);
  }

  static void requestsOfMemoryToABitmapOfOddSize() {
    byte[] data = Pictures.nv21(15, 9, Pictures::patches);
    failEveryRequest(() -> convert(data, 15, 9, 15, 9), TABLE_TO_RGB);
  }

  private interface Conversion {
    Object run();
  }

  /** A conversion table that cannot be had leaves the picture undrawn and is not reported. */
  private static void failEveryRequest(Conversion conversion, int tableBytes) {
    TesselDouble.reset();
    Check.notNull(conversion.run(), "the result");
    int requests = TesselDouble.requests();
    Check.that(requests >= 5, "only " + requests + " requests");
    int[] bytes = new int[requests];
    for (int n = 1; n <= requests; ++n) {
      bytes[n - 1] = TesselDouble.requestedBytes(n);
    }
    for (int n = 1; n <= requests; ++n) {
      TesselDouble.reset();
      TesselDouble.failRequest(n);
      Object result = conversion.run();
      boolean expected = bytes[n - 1] == tableBytes;
      Check.that((result != null) == expected, "result with request " + n + " failed: " + result);
      Main.checkBalance();
    }
  }

  static void callsOnTheGivenBitmap() {
    String[] calls = {"getInfo", "lockPixels", "unlockPixels"};
    for (int n = 1; n <= calls.length; ++n) {
      for (int code = -3; code <= -1; ++code) {
        BitmapProbe.reset();
        BitmapProbe.failCall(n, code);
        Bitmap bitmap = Pictures.paint(20, 10, Pictures::patches);
        String what = calls[n - 1] + " answers " + code;
        if (code == BitmapProbe.JNI_EXCEPTION) {
          Check.throwing(IllegalStateException.class, () -> convert(bitmap), what);
        } else {
          Check.that((convert(bitmap) != null) == (n == 3), "result where " + what);
        }
        Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held where " + what);
        Check.equal(BitmapProbe.locks(), BitmapProbe.unlocks(), "unlocks where " + what);
        Check.equal(n == 3 ? 0 : 1, BitmapProbe.refusedUnlocks(), "idle unlocks where " + what);
      }
    }
    BitmapProbe.reset();
  }

  static void callsOnTheNewBitmap() {
    String[] calls = {"getInfo", "lockPixels", "unlockPixels"};
    byte[] data = Pictures.nv21(16, 16, (x, y) -> 0xFFFFFF);
    for (int n = 1; n <= calls.length; ++n) {
      for (int code = -3; code <= -1; ++code) {
        BitmapProbe.reset();
        BitmapProbe.failCall(n, code);
        String what = calls[n - 1] + " answers " + code;
        if (code == BitmapProbe.JNI_EXCEPTION) {
          Check.throwing(
              IllegalStateException.class, () -> convert(data, 16, 16, 16, 16), what);
        } else {
          // The Bitmap is there, its pixels could not be reached.
          Bitmap bitmap = convert(data, 16, 16, 16, 16);
          Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held where " + what);
          bitmap.setHasAlpha(false);
          int expected = n == 3 ? 0xFFFFFF : 0;
          int color = bitmap.getPixel(5, 5);
          Pictures.checkColor(expected, color, Pictures.TOLERANCE, "where " + what, 5, 5);
        }
        Check.equal(BitmapProbe.locks(), BitmapProbe.unlocks(), "unlocks where " + what);
        Check.equal(0, BitmapProbe.refusedUnlocks(), "idle unlocks where " + what);
      }
    }
    BitmapProbe.reset();
  }

  static void noNewBitmap() {
    byte[] data = Pictures.nv21(16, 16, Pictures::patches);
    BitmapProbe.createNull();
    Check.isNull(convert(data, 16, 16, 16, 16), "the result");
    Check.equal(0, BitmapProbe.calls(), "calls on Bitmaps");
  }

  static void createBitmapThrows() {
    byte[] data = Pictures.nv21(16, 16, Pictures::patches);
    // The stand-in has no room for its margins then.
    BitmapProbe.setStridePadding(Integer.MAX_VALUE / 16);
    Check.throwing(OutOfMemoryError.class, () -> convert(data, 16, 16, 16, 16), "createBitmap");
    BitmapProbe.reset();
    Check.notNull(convert(data, 16, 16, 16, 16), "the result afterwards");
  }
}

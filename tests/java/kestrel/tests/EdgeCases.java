package kestrel.tests;

import static kestrel.tests.Pictures.convert;

import android.graphics.Bitmap;
import android.graphics.BitmapProbe;
import java.util.Arrays;

/** What gives null, what gives which length, and that nothing given is changed. */
final class EdgeCases {
  private EdgeCases() {}

  static void noBitmap() {
    Check.isNull(convert(null), "the result");
    Check.equal(0, BitmapProbe.calls(), "calls on Bitmaps");
  }

  static void noArray() {
    Check.isNull(convert(null, 64, 48, 64, 48), "the result");
  }

  static void otherConfigurations() {
    Bitmap.Config[] configs = {Bitmap.Config.RGB_565, Bitmap.Config.ALPHA_8};
    for (Bitmap.Config config : configs) {
      Bitmap bitmap = Bitmap.createBitmap(64, 48, config);
      Check.isNull(convert(bitmap), "the result for " + config);
      Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held");
    }
    Check.equal(2, BitmapProbe.unlocks(), "unlocks");
  }

  static void lengthOfTheArray() {
    byte[] nv21 = convert(Pictures.paint(64, 48, (x, y) -> 0xFF0000));
    Check.equal(4608, nv21.length, "length");
    for (int i = 0; i < nv21.length; ++i) {
      int expected = i < 3072 ? 76 : i % 2 == 0 ? 255 : 84;
      Check.near(expected, nv21[i] & 0xFF, 1, "the array", i % 64, i / 64);
    }
  }

  static void recycledBitmap() {
    Bitmap bitmap = Pictures.paint(16, 16, Pictures::patches);
    bitmap.recycle();
    Check.isNull(convert(bitmap), "the result");
    // The unlock after a lock that failed ends nothing.
    Check.equal(1, BitmapProbe.refusedUnlocks(), "unlocks without a lock");
  }

  static void everyLockIsEnded() {
    Bitmap bitmap = Pictures.paint(16, 16, Pictures::patches);
    convert(bitmap);
    convert(bitmap);
    Check.equal(2, BitmapProbe.locks(), "locks");
    Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held");
    Check.equal(0, BitmapProbe.refusedUnlocks(), "unlocks without a lock");
  }

  static void givenThingsStayAsTheyAre() {
    for (int padding : new int[] {0, 4, 60}) {
      BitmapProbe.setStridePadding(padding);
      Bitmap bitmap = Pictures.paint(21, 13, Pictures::patches);
      byte[] before = Pictures.bytesOf(bitmap);
      convert(bitmap);
      Check.that(Arrays.equals(before, Pictures.bytesOf(bitmap)), "the Bitmap changed");
      Check.that(BitmapProbe.marginsIntact(bitmap), "bytes beside the pixels changed");

      byte[] data = Pictures.nv21(21, 13, Pictures::patches);
      byte[] copy = data.clone();
      convert(data, 21, 13, 40, 9);
      Check.that(Arrays.equals(copy, data), "the array changed");
    }
  }

  static void shortArrays() {
    for (int[] size : new int[][] {{64, 48}, {15, 9}, {3, 3}, {2, 1}, {1, 1}}) {
      int length = size[0] * size[1] * 3 / 2;
      for (int missing : new int[] {1, (length + 2) / 3, length}) {
        byte[] data = new byte[length - missing];
        Check.isNull(convert(data, size[0], size[1], 8, 8), "the result of " + data.length);
      }
      Check.notNull(convert(new byte[length], size[0], size[1], 8, 8), "the result of " + length);
    }
  }

  static void impossibleSizes() {
    int most = Integer.MAX_VALUE;
    int least = Integer.MIN_VALUE;
    byte[] data = new byte[96];
    for (int bad : new int[] {0, -1, -8, least, most, most - 7, 1 << 30, 46341, 65536}) {
      Check.isNull(convert(data, bad, 8, 8, 8), "source width " + bad);
      Check.isNull(convert(data, 8, bad, 8, 8), "source height " + bad);
      Check.isNull(convert(data, bad, bad, 8, 8), "source size " + bad);
      Check.isNull(convert(data, 8, 8, bad, bad), "size " + bad);
    }
    for (int bad : new int[] {0, -1, -8, least, most, most - 7, 1 << 30}) {
      Check.isNull(convert(data, 8, 8, bad, 8), "width " + bad);
      Check.isNull(convert(data, 8, 8, 8, bad), "height " + bad);
    }
  }

  static void farTooLarge() {
    Check.isNull(convert(new byte[1], 1, 1, 100000, 1), "the result");
    Check.that(TesselDouble.requests() > 0, "the conversion was not tried");
  }

  static void smallestPictures() {
    Bitmap one = convert(new byte[] {77}, 1, 1, 1, 1);
    one.setHasAlpha(false);
    Pictures.checkColor(0x4D4D4D, one.getPixel(0, 0), Pictures.TOLERANCE, "the Bitmap", 0, 0);
    Check.equal(1, convert(Pictures.paint(1, 1, (x, y) -> 0x808080)).length, "length of 1 x 1");
    Check.equal(3, convert(Pictures.paint(2, 1, (x, y) -> 0x808080)).length, "length of 2 x 1");
    Check.equal(13, convert(Pictures.paint(3, 3, (x, y) -> 0x808080)).length, "length of 3 x 3");
  }
}

package kestrel.tests;

import static kestrel.tests.Pictures.TOLERANCE;
import static kestrel.tests.Pictures.convert;

import android.graphics.Bitmap;
import android.graphics.BitmapProbe;

/** Bytes and colours of results, against the textbook arithmetic of BT.601 in full range. */
final class Pixels {
  private static final int[][] SIZES = {
    {64, 48}, {16, 16}, {48, 2}, {15, 16}, {17, 16}, {31, 33}, {100, 50}, {2, 2}, {1, 1}, {3, 5},
    {1, 9}, {9, 1}, {130, 66}
  };

  private Pixels() {}

  /**
   * Rows of the array are as far apart as those of the image it is copied from, whose widths are
   * whole multiples of 16; what does not fit the length is cut off, and gaps are zero.
   */
  static void layoutOfTheArray() {
    for (int[] size : SIZES) {
      for (int padding : new int[] {0, 8, 52}) {
        BitmapProbe.setStridePadding(padding);
        checkArray(size[0], size[1]);
      }
    }
  }

  private static void checkArray(int width, int height) {
    byte[] nv21 = convert(Pictures.paint(width, height, Pictures::patches));
    String what = width + " x " + height;
    String lumaOf = "luma of " + what;
    String chromaOf = "chroma of " + what;
    Check.notNull(nv21, what);
    Check.equal(width * height * 3 / 2, nv21.length, "length of " + what);
    int pitch = (width + 15) / 16 * 16;
    int luma = width * height;
    for (int i = 0; i < luma; ++i) {
      int x = i % pitch;
      int y = i / pitch;
      int expected = x < width ? Pictures.luma(Pictures.patches(x, y)) : 0;
      int tolerance = x < width ? TOLERANCE : 0;
      Check.near(expected, nv21[i] & 0xFF, tolerance, lumaOf, x, y);
    }
    for (int i = 0; i < nv21.length - luma; ++i) {
      int x = i % pitch / 2 * 2;
      int y = i / pitch * 2;
      boolean inside = x < width && y < height;
      int color = Pictures.patches(x, y);
      int expected = !inside ? 0 : i % 2 == 0 ? Pictures.v(color) : Pictures.u(color);
      int tolerance = inside ? TOLERANCE : 0;
      Check.near(expected, nv21[luma + i] & 0xFF, tolerance, chromaOf, i % pitch, i / pitch);
    }
  }

  static void coloursOfTheBitmap() {
    for (int[] size : SIZES) {
      for (int padding : new int[] {0, 8, 52}) {
        BitmapProbe.setStridePadding(padding);
        checkBitmap(size[0], size[1]);
      }
    }
  }

  private static void checkBitmap(int width, int height) {
    byte[] data = Pictures.nv21(width, height, Pictures::patches);
    Bitmap bitmap = convert(data, width, height, width, height);
    String what = width + " x " + height;
    Check.equal(width, bitmap.getWidth(), "width of " + what);
    Check.equal(height, bitmap.getHeight(), "height of " + what);
    Check.that(bitmap.getConfig() == Bitmap.Config.ARGB_8888, "configuration of " + what);
    Check.that(BitmapProbe.marginsIntact(bitmap), "bytes beside the pixels changed, " + what);
    byte[] bytes = Pictures.bytesOf(bitmap);
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        int at = y * bitmap.getRowBytes() + 4 * x;
        int pair = width * height + y / 2 * width + x / 2 * 2;
        // Arrays of odd sizes end before their last chroma: those pixels are grey.
        int v = pair < data.length ? data[pair] & 0xFF : 128;
        int u = pair + 1 < data.length ? data[pair + 1] & 0xFF : 128;
        int expected = Pictures.color(data[y * width + x] & 0xFF, u, v);
        int actual = (bytes[at] & 0xFF) << 16 | (bytes[at + 1] & 0xFF) << 8 | bytes[at + 2] & 0xFF;
        Pictures.checkColor(expected, actual, TOLERANCE, what, x, y);
        Check.near(0, bytes[at + 3], 0, "alpha", x, y);
      }
    }
  }

  static void thereAndBack() {
    Pictures.Painter painter = Pictures::patches;
    byte[] nv21 = convert(Pictures.paint(64, 32, painter));
    Bitmap bitmap = convert(nv21, 64, 32, 64, 32);
    bitmap.setHasAlpha(false);
    for (int y = 0; y < 32; ++y) {
      for (int x = 0; x < 64; ++x) {
        int color = bitmap.getPixel(x, y);
        Pictures.checkColor(painter.colorAt(x, y), color, 4, "the Bitmap", x, y);
      }
    }
  }

  static void flatPicturesStayFlatInAnySize() {
    byte[] data = Pictures.nv21(48, 32, (x, y) -> 0x3C8C5A);
    int[][] sizes = {{48, 32}, {96, 64}, {24, 16}, {31, 17}, {7, 5}, {200, 30}, {48, 96}};
    for (int[] size : sizes) {
      String what = size[0] + " x " + size[1];
      Bitmap bitmap = convert(data, 48, 32, size[0], size[1]);
      bitmap.setHasAlpha(false);
      for (int y = 0; y < size[1]; ++y) {
        for (int x = 0; x < size[0]; ++x) {
          Pictures.checkColor(0x3C8C5A, bitmap.getPixel(x, y), 3, what, x, y);
        }
      }
    }
  }

  /** Four quarters of different colours stay in their places, larger and smaller. */
  static void quarters() {
    Pictures.Painter painter =
        (x, y) -> y < 32 ? (x < 48 ? 0xE02020 : 0x20C030) : (x < 48 ? 0x3040E0 : 0xE0E0E0);
    byte[] data = Pictures.nv21(96, 64, painter);
    int[][] sizes = {{192, 128}, {288, 192}, {48, 32}, {33, 22}, {99, 66}, {24, 16}};
    for (int[] size : sizes) {
      int width = size[0];
      int height = size[1];
      String what = width + " x " + height;
      Bitmap bitmap = convert(data, 96, 64, width, height);
      bitmap.setHasAlpha(false);
      for (int y = 0; y < height; ++y) {
        for (int x = 0; x < width; ++x) {
          // Two source pixels on each side of the borders may be mixed.
          double column = (x + 0.5) * 96 / width;
          double row = (y + 0.5) * 64 / height;
          if (Math.abs(column - 48) < 3 || Math.abs(row - 32) < 3) {
            continue;
          }
          int expected = painter.colorAt((int) column, (int) row);
          Pictures.checkColor(expected, bitmap.getPixel(x, y), 3, what, x, y);
        }
      }
    }
  }

  static void interpolatesLuma() {
    checkRow(new int[] {10, 20, 40, 80}, new int[] {10, 12, 17, 25, 35, 50, 70, 80});
    checkRow(new int[] {10, 20, 40, 80, 81, 90, 200, 100}, new int[] {15, 60, 85, 150});
  }

  private static void checkRow(int[] source, int[] expected) {
    byte[] data = Pictures.nv21(source.length, source.length, (x, y) -> source[x] * 0x010101);
    Bitmap bitmap = convert(data, source.length, source.length, expected.length, expected.length);
    bitmap.setHasAlpha(false);
    for (int y = 0; y < expected.length; ++y) {
      for (int x = 0; x < expected.length; ++x) {
        int grey = expected[x] * 0x010101;
        Pictures.checkColor(grey, bitmap.getPixel(x, y), TOLERANCE, "the Bitmap", x, y);
      }
    }
  }

  /** A wide picture in a square: the columns of the middle, unscaled. */
  static void cutsTheLongerSide() {
    byte[] data = Pictures.nv21(96, 64, Pictures::patches);
    Bitmap bitmap = convert(data, 96, 64, 64, 64);
    bitmap.setHasAlpha(false);
    for (int y = 0; y < 64; ++y) {
      for (int x = 0; x < 64; ++x) {
        int at = y * 96 + x + 16;
        int pair = 96 * 64 + y / 2 * 96 + (x + 16) / 2 * 2;
        int expected = Pictures.color(data[at] & 0xFF, data[pair + 1] & 0xFF, data[pair] & 0xFF);
        Pictures.checkColor(expected, bitmap.getPixel(x, y), TOLERANCE, "the Bitmap", x, y);
      }
    }
  }
}

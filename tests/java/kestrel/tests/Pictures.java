package kestrel.tests;

import android.graphics.Bitmap;
import com.kestrel.dualcam.refocus.ImagePostProcessNativeEngine;
import java.nio.ByteBuffer;

/** Pictures, their colours in both forms, and the natives that turn one into the other. */
final class Pictures {
  /** Colours that the arithmetic of the library may miss the exact ones by. */
  static final int TOLERANCE = 2;

  static final ImagePostProcessNativeEngine ENGINE = new ImagePostProcessNativeEngine();

  private Pictures() {}

  /** A colour 0xRRGGBB for each pixel. */
  interface Painter {
    int colorAt(int x, int y);
  }

  /** Different colours for neighbours, the same for the four pixels of a chroma sample. */
  static int patches(int x, int y) {
    return (x / 2 * 0x1D2F43 + y / 2 * 0x35A1B7 + 0x204060) & 0xFFFFFF;
  }

  static Bitmap paint(int width, int height, Painter painter) {
    int[] colors = new int[width * height];
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        colors[y * width + x] = 0xFF000000 | painter.colorAt(x, y);
      }
    }
    return Bitmap.createBitmap(colors, width, height, Bitmap.Config.ARGB_8888);
  }

  static byte[] bytesOf(Bitmap bitmap) {
    byte[] bytes = new byte[bitmap.getByteCount()];
    bitmap.copyPixelsToBuffer(ByteBuffer.wrap(bytes));
    return bytes;
  }

  /** The array of a picture whose rows lie without gaps. */
  static byte[] nv21(int width, int height, Painter painter) {
    byte[] bytes = new byte[width * height * 3 / 2];
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        int color = painter.colorAt(x, y);
        bytes[y * width + x] = (byte) luma(color);
        int pair = width * height + y / 2 * width + x / 2 * 2;
        if (pair + 1 < bytes.length) {
          bytes[pair] = (byte) v(color);
          bytes[pair + 1] = (byte) u(color);
        }
      }
    }
    return bytes;
  }

  static byte[] convert(Bitmap bitmap) {
    return ENGINE.ConvertCS2NV21(bitmap);
  }

  static Bitmap convert(byte[] data, int srcWidth, int srcHeight, int dstWidth, int dstHeight) {
    return ENGINE.ConvertCS2Bitmap(data, srcWidth, srcHeight, dstWidth, dstHeight);
  }

  // BT.601 in full range.

  static int luma(int color) {
    return clamp(0.299 * red(color) + 0.587 * green(color) + 0.114 * blue(color));
  }

  static int u(int color) {
    return clamp(128 - 0.168736 * red(color) - 0.331264 * green(color) + 0.5 * blue(color));
  }

  static int v(int color) {
    return clamp(128 + 0.5 * red(color) - 0.418688 * green(color) - 0.081312 * blue(color));
  }

  static int color(int luma, int u, int v) {
    int red = clamp(luma + 1.402 * (v - 128));
    int green = clamp(luma - 0.344136 * (u - 128) - 0.714136 * (v - 128));
    int blue = clamp(luma + 1.772 * (u - 128));
    return red << 16 | green << 8 | blue;
  }

  static int red(int color) {
    return color >> 16 & 0xFF;
  }

  static int green(int color) {
    return color >> 8 & 0xFF;
  }

  static int blue(int color) {
    return color & 0xFF;
  }

  static void checkColor(int expected, int actual, int tolerance, String what, int x, int y) {
    for (int shift = 0; shift <= 16; shift += 8) {
      Check.near(expected >> shift & 0xFF, actual >> shift & 0xFF, tolerance, what, x, y);
    }
  }

  private static int clamp(double value) {
    return (int) Math.max(0, Math.min(255, Math.round(value)));
  }
}

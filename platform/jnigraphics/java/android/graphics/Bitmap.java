package android.graphics;

import java.nio.Buffer;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/**
 * Desktop stand-in for the Bitmap of a device: the methods that programs around the natives use,
 * with the device's rules. The pixels lie in memory that native code can reach. What tests need
 * beyond that is in {@link BitmapProbe}.
 */
public final class Bitmap {
  /** Layouts of pixels. Only those that the natives know are here. */
  public enum Config {
    /** One byte per pixel, the alpha. */
    ALPHA_8(8, 1),
    /** Two bytes per pixel. */
    RGB_565(4, 2),
    /** Four bytes per pixel, in memory R, G, B, A, the colours multiplied by the alpha. */
    ARGB_8888(1, 4);

    /** The number native code knows the layout by. */
    final int format;

    final int bytesPerPixel;

    Config(int format, int bytesPerPixel) {
      this.format = format;
      this.bytesPerPixel = bytesPerPixel;
    }
  }

  // Read by name from libjnigraphics.
  private final int width;
  private final int height;
  private final int stride;
  private final int format;
  private ByteBuffer pixels;

  private final Config config;
  private boolean hasAlpha;
  private boolean recycled;
  private final BitmapProbe.Memory memory;

  private Bitmap(int width, int height, Config config) {
    this.width = width;
    this.height = height;
    this.config = config;
    format = config.format;
    stride = width * config.bytesPerPixel + BitmapProbe.stridePadding();
    hasAlpha = config != Config.RGB_565;
    memory = new BitmapProbe.Memory((long) stride * height);
    pixels = memory.pixels();
  }

  /** A transparent (black) Bitmap. */
  public static Bitmap createBitmap(int width, int height, Config config) {
    if (BitmapProbe.createsNull()) {
      return null;
    }
    if (width <= 0 || height <= 0) {
      throw new IllegalArgumentException("width and height must be > 0");
    }
    if (config == null) {
      throw new NullPointerException("config");
    }
    return new Bitmap(width, height, config);
  }

  /** A Bitmap of colours 0xAARRGGBB, not multiplied by their alpha. */
  public static Bitmap createBitmap(int[] colors, int width, int height, Config config) {
    Bitmap bitmap = createBitmap(width, height, config);
    bitmap.setPixels(colors, 0, width, 0, 0, width, height);
    return bitmap;
  }

  public int getWidth() {
    return width;
  }

  public int getHeight() {
    return height;
  }

  public Config getConfig() {
    return config;
  }

  /** Bytes from one row to the next, possibly more than the pixels of a row take. */
  public int getRowBytes() {
    return stride;
  }

  public int getByteCount() {
    return stride * height;
  }

  public boolean hasAlpha() {
    return hasAlpha;
  }

  /** Without alpha the pixels count as opaque, whatever their alpha byte says. */
  public void setHasAlpha(boolean hasAlpha) {
    this.hasAlpha = hasAlpha && config != Config.RGB_565;
  }

  public void recycle() {
    recycled = true;
  }

  public boolean isRecycled() {
    return recycled;
  }

  /** The colour 0xAARRGGBB, no longer multiplied by its alpha: 0 wherever the alpha is 0. */
  public int getPixel(int x, int y) {
    int at = offset(x, y);
    switch (config) {
      case ALPHA_8:
        return pixels.get(at) << 24;
      case RGB_565:
        int word = pixels.getShort(at) & 0xFFFF;
        int red = word >> 11;
        int green = word >> 5 & 0x3F;
        int blue = word & 0x1F;
        return argb(255, red << 3 | red >> 2, green << 2 | green >> 4, blue << 3 | blue >> 2);
      default:
        int alpha = hasAlpha ? pixels.get(at + 3) & 0xFF : 255;
        return argb(alpha, divided(at, alpha), divided(at + 1, alpha), divided(at + 2, alpha));
    }
  }

  public void setPixel(int x, int y, int color) {
    int at = offset(x, y);
    int alpha = color >>> 24;
    int red = color >> 16 & 0xFF;
    int green = color >> 8 & 0xFF;
    int blue = color & 0xFF;
    switch (config) {
      case ALPHA_8:
        pixels.put(at, (byte) alpha);
        break;
      case RGB_565:
        pixels.putShort(at, (short) (red >> 3 << 11 | green >> 2 << 5 | blue >> 3));
        break;
      default:
        pixels.put(at, multiplied(red, alpha));
        pixels.put(at + 1, multiplied(green, alpha));
        pixels.put(at + 2, multiplied(blue, alpha));
        pixels.put(at + 3, (byte) alpha);
        break;
    }
  }

  public void getPixels(
      int[] colors, int offset, int perRow, int x, int y, int columns, int rows) {
    for (int row = 0; row < rows; ++row) {
      for (int column = 0; column < columns; ++column) {
        colors[offset + row * perRow + column] = getPixel(x + column, y + row);
      }
    }
  }

  public void setPixels(
      int[] colors, int offset, int perRow, int x, int y, int columns, int rows) {
    for (int row = 0; row < rows; ++row) {
      for (int column = 0; column < columns; ++column) {
        setPixel(x + column, y + row, colors[offset + row * perRow + column]);
      }
    }
  }

  /** All rows as they lie in memory, padding included. */
  public void copyPixelsToBuffer(Buffer buffer) {
    checkNotRecycled();
    ((ByteBuffer) buffer).put(view());
  }

  /** The opposite of {@link #copyPixelsToBuffer}. */
  public void copyPixelsFromBuffer(Buffer buffer) {
    checkNotRecycled();
    ByteBuffer source = (ByteBuffer) buffer;
    ByteBuffer from = source.duplicate();
    from.limit(from.position() + getByteCount());
    view().put(from);
    source.position(source.position() + getByteCount());
  }

  /** Called by libjnigraphics at each of its functions; returns its result. */
  private int onNativeCall(int function) {
    return BitmapProbe.onNativeCall(memory, function, recycled);
  }

  BitmapProbe.Memory memory() {
    return memory;
  }

  private ByteBuffer view() {
    ByteBuffer all = pixels.duplicate();
    all.clear();
    return all;
  }

  private int offset(int x, int y) {
    checkNotRecycled();
    if (x < 0 || x >= width || y < 0 || y >= height) {
      throw new IllegalArgumentException("(" + x + ", " + y + ") lies outside the bitmap");
    }
    pixels.order(ByteOrder.nativeOrder());
    return y * stride + x * config.bytesPerPixel;
  }

  private void checkNotRecycled() {
    if (recycled) {
      throw new IllegalStateException("the bitmap is recycled");
    }
  }

  private int divided(int at, int alpha) {
    int value = pixels.get(at) & 0xFF;
    return alpha == 0 ? 0 : Math.min(255, (value * 255 + alpha / 2) / alpha);
  }

  private static byte multiplied(int value, int alpha) {
    return (byte) ((value * alpha + 127) / 255);
  }

  private static int argb(int alpha, int red, int green, int blue) {
    return alpha << 24 | red << 16 | green << 8 | blue;
  }
}

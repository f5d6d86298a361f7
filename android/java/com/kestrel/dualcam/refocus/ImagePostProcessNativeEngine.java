package com.kestrel.dualcam.refocus;

import android.graphics.Bitmap;

/**
 * Converts Bitmaps to NV21 arrays and NV21 arrays to Bitmaps, in native code.
 *
 * <p>An NV21 array of a width x height picture is width * height bytes of luma, row after row, then
 * width * height / 2 bytes of chroma: pairs V, U for each 2 x 2 block of pixels. Its length is
 * {@code width * height * 3 / 2}. Colours are BT.601 in full range.
 *
 * <p>Every failure is a null result. An exception is thrown only where the virtual machine itself
 * raises one, such as {@link OutOfMemoryError} for the result.
 *
 * <p>An object has no state: one may serve any number of threads at once.
 */
public class ImagePostProcessNativeEngine {
  static {
    System.loadLibrary("kestrel_postprocess");
  }

  /**
   * The picture of a Bitmap as an NV21 array of the same size.
   *
   * <p>Rows of the array lie without gaps only when the width is a multiple of 16. For other widths
   * they are {@code (width + 15) / 16 * 16} bytes apart while the length stays that of rows without
   * gaps, so the picture's lower end is cut off. The chroma bytes begin at width * height in any
   * case and lie as far apart. Scale or pad the Bitmap to a width that is a multiple of 16.
   *
   * <p>The chroma of a block is that of its bottom right pixel. Alpha is ignored; the colours are
   * taken as they are stored, multiplied by the alpha.
   *
   * @param bitmap a Bitmap in {@link Bitmap.Config#ARGB_8888}; not changed
   * @return a new array, or null if the Bitmap is null, has another configuration or no pixels
   */
  public native byte[] ConvertCS2NV21(Bitmap bitmap);

  /**
   * The picture of an NV21 array as a new Bitmap, scaled to another size.
   *
   * <p>If the proportions differ, the picture is cut on two opposite sides to those of the Bitmap.
   * Scaling interpolates linearly; pictures that need none are copied.
   *
   * <p>The alpha of all pixels is 0: call {@link Bitmap#setHasAlpha setHasAlpha(false)} before
   * showing or storing the Bitmap, or it appears transparent.
   *
   * <p>Where a side is odd, the array ends before its last chroma does: that end of the last two
   * rows comes out grey.
   *
   * @param data at least srcWidth * srcHeight * 3 / 2 bytes of NV21 without gaps between rows; not
   *     changed
   * @param srcWidth columns of the array's picture, at least 1
   * @param srcHeight rows of the array's picture, at least 1
   * @param dstWidth columns of the Bitmap, at least 1
   * @param dstHeight rows of the Bitmap, at least 1
   * @return a new Bitmap in {@link Bitmap.Config#ARGB_8888}, or null if the array is null or too
   *     short, a size is below 1 or memory is short
   */
  public native Bitmap ConvertCS2Bitmap(
      byte[] data, int srcWidth, int srcHeight, int dstWidth, int dstHeight);
}

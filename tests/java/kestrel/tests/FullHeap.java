package kestrel.tests;

import static kestrel.tests.Pictures.convert;

import android.graphics.Bitmap;
import android.graphics.BitmapProbe;

/** To be run with a heap of 32 MB: results that do not fit. */
final class FullHeap {
  private FullHeap() {}

  static void theArrayDoesNotFit() {
    Bitmap bitmap = Bitmap.createBitmap(6000, 5000, Bitmap.Config.ARGB_8888);
    for (int i = 0; i < 3; ++i) {
      Check.throwing(OutOfMemoryError.class, () -> convert(bitmap), "an array of 45 MB");
      Check.equal(0, BitmapProbe.locksHeld(bitmap), "locks held");
      Main.checkBalance();
    }
    Check.notNull(convert(Pictures.paint(16, 16, Pictures::patches)), "the result afterwards");
  }
}

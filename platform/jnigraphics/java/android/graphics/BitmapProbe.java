package android.graphics;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;

/**
 * What tests see and steer of the desktop's Bitmaps: locks, bytes beside the pixels, wide rows,
 * failures. Counts and plans are those of the whole process.
 */
public final class BitmapProbe {
  public static final int SUCCESS = 0;
  public static final int BAD_PARAMETER = -1;
  public static final int JNI_EXCEPTION = -2;
  public static final int ALLOCATION_FAILED = -3;

  public static final int GET_INFO = 0;
  public static final int LOCK_PIXELS = 1;
  public static final int UNLOCK_PIXELS = 2;

  private static final int MARGIN = 64;
  private static final byte MARGIN_BYTE = (byte) 0xC7;

  private static int stridePadding;
  private static boolean createsNull;
  private static int failedCall;
  private static int failure;
  private static int calls;
  private static int locks;
  private static int unlocks;
  private static int refusedUnlocks;

  private BitmapProbe() {}

  /** Forgets plans and counts. */
  public static synchronized void reset() {
    stridePadding = 0;
    createsNull = false;
    failedCall = 0;
    calls = 0;
    locks = 0;
    unlocks = 0;
    refusedUnlocks = 0;
  }

  /** Bitmaps made from now on have rows longer by this many bytes. */
  public static synchronized void setStridePadding(int bytes) {
    stridePadding = bytes;
  }

  /** createBitmap returns null from now on. */
  public static synchronized void createNull() {
    createsNull = true;
  }

  /**
   * The n-th native call since the last reset, counted from 1, answers with this code; with
   * JNI_EXCEPTION an exception is pending.
   */
  public static synchronized void failCall(int n, int code) {
    failedCall = n;
    failure = code;
  }

  /** Native calls since the last reset, those on no Bitmap at all not included. */
  public static synchronized int calls() {
    return calls;
  }

  /** Successful locks. */
  public static synchronized int locks() {
    return locks;
  }

  /** Unlocks that ended a lock. */
  public static synchronized int unlocks() {
    return unlocks;
  }

  /** Unlocks of a Bitmap that was not locked. */
  public static synchronized int refusedUnlocks() {
    return refusedUnlocks;
  }

  /** Locks of this Bitmap that were not ended yet. */
  public static synchronized int locksHeld(Bitmap bitmap) {
    return bitmap.memory().locks;
  }

  /** Whether the bytes before and behind the pixels are as they were made. */
  public static boolean marginsIntact(Bitmap bitmap) {
    ByteBuffer block = bitmap.memory().block;
    for (int i = 0; i < MARGIN; ++i) {
      if (block.get(i) != MARGIN_BYTE || block.get(block.capacity() - 1 - i) != MARGIN_BYTE) {
        return false;
      }
    }
    return true;
  }

  static synchronized int stridePadding() {
    return stridePadding;
  }

  static synchronized boolean createsNull() {
    return createsNull;
  }

  static synchronized int onNativeCall(Memory memory, int function, boolean recycled) {
    ++calls;
    if (calls == failedCall) {
      if (function == UNLOCK_PIXELS && memory.locks > 0) { // asking for it is all a caller can do
        --memory.locks;
        ++unlocks;
      }
      if (failure == JNI_EXCEPTION) {
        throw new IllegalStateException("planned failure of native call " + calls);
      }
      return failure;
    }
    switch (function) {
      case LOCK_PIXELS:
        if (recycled) {
          return JNI_EXCEPTION;
        }
        ++memory.locks;
        ++locks;
        return SUCCESS;
      case UNLOCK_PIXELS:
        if (memory.locks == 0) {
          ++refusedUnlocks;
          return BAD_PARAMETER;
        }
        --memory.locks;
        ++unlocks;
        return SUCCESS;
      default:
        return SUCCESS;
    }
  }

  /** Pixels between two margins. */
  static final class Memory {
    final ByteBuffer block;
    int locks;

    Memory(long bytes) {
      if (bytes > Integer.MAX_VALUE - 2 * MARGIN) {
        throw new OutOfMemoryError("a bitmap of " + bytes + " bytes");
      }
      block = ByteBuffer.allocateDirect((int) bytes + 2 * MARGIN).order(ByteOrder.nativeOrder());
      for (int i = 0; i < MARGIN; ++i) {
        block.put(i, MARGIN_BYTE);
        block.put(block.capacity() - 1 - i, MARGIN_BYTE);
      }
    }

    ByteBuffer pixels() {
      ByteBuffer all = block.duplicate();
      all.position(MARGIN);
      all.limit(block.capacity() - MARGIN);
      return all.slice().order(ByteOrder.nativeOrder());
    }
  }
}

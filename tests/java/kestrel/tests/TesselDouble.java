package kestrel.tests;

/** The base library of these tests: counts blocks, fails on demand, notices misuse. */
final class TesselDouble {
  static {
    // Under the name that the library needs, so that no other is loaded.
    System.load(System.getProperty("kestrel.tessel"));
  }

  private TesselDouble() {}

  /** Forgets plans, requests and faults; live blocks stay known. */
  static native void reset();

  /** The n-th request since the last reset fails, counted from 1. */
  static native void failRequest(int n);

  static native int requests();

  /** Bytes that the n-th request since the last reset asked for, counted from 1. */
  static native int requestedBytes(int n);

  static native int liveBlocks();

  /** What was done wrong since the last reset, a line each; empty for nothing. */
  static native String faults();
}

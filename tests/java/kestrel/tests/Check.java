package kestrel.tests;

/** Assertions that are always on. */
final class Check {
  private Check() {}

  static void that(boolean holds, String what) {
    if (!holds) {
      throw new AssertionError(what);
    }
  }

  static void equal(long expected, long actual, String what) {
    that(expected == actual, what + ": expected " + expected + ", got " + actual);
  }

  /** The place is told as two numbers: texts for each pixel would take most of the time. */
  static void near(int expected, int actual, int tolerance, String what, int x, int y) {
    if (Math.abs(expected - actual) > tolerance) {
      throw new AssertionError(
          what + " at " + x + ", " + y + ": expected " + expected + " or " + tolerance
              + " off, got " + actual);
    }
  }

  static void isNull(Object object, String what) {
    that(object == null, what + " is not null");
  }

  static void notNull(Object object, String what) {
    that(object != null, what + " is null");
  }

  interface Action {
    void run() throws Throwable;
  }

  /** Returns what the action throws. */
  static <T extends Throwable> T throwing(Class<T> type, Action action, String what) {
    try {
      action.run();
    } catch (Throwable thrown) {
      that(type.isInstance(thrown), what + " throws " + thrown);
      return type.cast(thrown);
    }
    throw new AssertionError(what + " throws nothing");
  }
}

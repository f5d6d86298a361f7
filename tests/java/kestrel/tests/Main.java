package kestrel.tests;

import android.graphics.BitmapProbe;
import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.util.Arrays;
import java.util.Comparator;

/**
 * Runs the tests of the named classes of this package: their static methods without parameters that
 * are not private. After each, every lock is ended and every block of the base library freed.
 */
public final class Main {
  private Main() {}

  public static void main(String[] suites) throws Exception {
    int passed = 0;
    int failed = 0;
    for (String suite : suites) {
      Method[] methods = Class.forName("kestrel.tests." + suite).getDeclaredMethods();
      Arrays.sort(methods, Comparator.comparing(Method::getName));
      for (Method method : methods) {
        if (!isTest(method)) {
          continue;
        }
        if (run(suite, method)) {
          ++passed;
        } else {
          ++failed;
        }
      }
    }
    System.out.println(passed + " passed, " + failed + " failed");
    System.exit(passed > 0 && failed == 0 ? 0 : 1);
  }

  private static boolean isTest(Method method) {
    int modifiers = method.getModifiers();
    return Modifier.isStatic(modifiers)
        && !Modifier.isPrivate(modifiers)
        && !method.isSynthetic()
        && method.getParameterCount() == 0;
  }

  private static boolean run(String suite, Method method) throws IllegalAccessException {
    BitmapProbe.reset();
    TesselDouble.reset();
    try {
      method.invoke(null);
      checkBalance();
      System.out.println("ok      " + suite + "." + method.getName());
      return true;
    } catch (InvocationTargetException e) {
      report(suite, method, e.getCause());
    } catch (AssertionError e) {
      report(suite, method, e);
    }
    return false;
  }

  private static void report(String suite, Method method, Throwable thrown) {
    System.out.println("FAILED  " + suite + "." + method.getName());
    thrown.printStackTrace(System.out);
  }

  static void checkBalance() {
    Check.equal(BitmapProbe.locks(), BitmapProbe.unlocks(), "locks that were ended");
    Check.equal(0, TesselDouble.liveBlocks(), "blocks of the base library still allocated");
    Check.that(TesselDouble.faults().isEmpty(), "base library: " + TesselDouble.faults());
  }
}

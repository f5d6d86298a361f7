package kestrel.tests;

import static kestrel.tests.Pictures.convert;

import android.graphics.Bitmap;
import android.graphics.BitmapProbe;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.concurrent.Callable;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;

/** Many conversions, at the same time and one after the other. */
final class Load {
  private static final int THREADS = 8;
  private static final int CONVERSIONS = Integer.getInteger("kestrel.conversions", 10000);

  private Load() {}

  /** Threads convert pictures of their own and a shared one, and get what one alone gets. */
  static void threads() throws Exception {
    Bitmap shared = Pictures.paint(40, 24, Pictures::patches);
    byte[] sharedExpected = convert(shared);
    ExecutorService pool = Executors.newFixedThreadPool(THREADS);
    List<Future<Integer>> results = new ArrayList<>();
    for (int i = 0; i < THREADS; ++i) {
      int width = 16 + 7 * i;
      byte[] data = Pictures.nv21(width, 20, (x, y) -> Pictures.patches(x + width, y));
      byte[] expected = Pictures.bytesOf(convert(data, width, 20, 30, 30));
      Callable<Integer> task =
          () -> {
            int done = 0;
            while (done < CONVERSIONS / THREADS) {
              Bitmap bitmap = convert(data, width, 20, 30, 30);
              Check.that(Arrays.equals(expected, Pictures.bytesOf(bitmap)), "the Bitmap differs");
              Check.that(BitmapProbe.marginsIntact(bitmap), "bytes beside the pixels changed");
              Check.that(Arrays.equals(sharedExpected, convert(shared)), "the array differs");
              done += 2;
            }
            return done;
          };
      results.add(pool.submit(task));
    }
    int done = 0;
    for (Future<Integer> result : results) {
      done += result.get();
    }
    pool.shutdown();
    Check.that(done >= CONVERSIONS, "only " + done + " conversions");
    Check.equal(0, BitmapProbe.refusedUnlocks(), "unlocks without a lock");
    Check.equal(0, BitmapProbe.locksHeld(shared), "locks held");
  }

  /** Elements that were not released would stay as copies of 1.5 MB each. */
  static void arrayElementsAreReleased() throws IOException {
    byte[] data = new byte[1000 * 1000 * 3 / 2];
    for (int i = 0; i < 50; ++i) {
      convert(data, 1000, 1000, 8, 8);
    }
    long before = residentKilobytes();
    int count = 600;
    for (int i = 0; i < count; ++i) {
      convert(data, 1000, 1000, 8, 8);
      Check.isNull(convert(data, 1001, 1000, 8, 8), "the result of a short array");
    }
    long growth = residentKilobytes() - before;
    Check.that(growth < 400_000, "the process grew by " + growth + " KB");
  }

  private static long residentKilobytes() throws IOException {
    for (String line : Files.readAllLines(Paths.get("/proc/self/status"))) {
      if (line.startsWith("VmRSS:")) {
        return Long.parseLong(line.replaceAll("[^0-9]", ""));
      }
    }
    throw new IOException("no VmRSS in /proc/self/status");
  }
}

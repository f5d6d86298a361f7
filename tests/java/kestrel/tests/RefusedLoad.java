package kestrel.tests;

/** To be run without the engine's class: the virtual machine refuses the library. */
public final class RefusedLoad {
  private RefusedLoad() {}

  public static void main(String[] args) {
    Throwable thrown =
        Check.throwing(
            LinkageError.class, () -> System.loadLibrary("kestrel_postprocess"), "loading");
    Check.that(
        thrown.toString().contains("ImagePostProcessNativeEngine"), "the reason is " + thrown);
    System.out.println("refused: " + thrown);
  }
}

import android.graphics.Bitmap;
import com.kestrel.dualcam.refocus.ImagePostProcessNativeEngine;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import javax.imageio.ImageIO;

/**
 * A photo as a Bitmap, turned into an NV21 array and back into a Bitmap of another size, on a
 * desktop. The Bitmap class is the desktop's stand-in; on a device the two calls are the same. From
 * the source's folder, with the library built in BUILD:
 *
 * <pre>
 * javac -d classes -sourcepath android/java:platform/jnigraphics/java \
 *     examples/java/ResizePhoto.java
 * java -cp classes -Djava.library.path=BUILD ResizePhoto photo.jpg 480 480 out.png
 * </pre>
 */
public final class ResizePhoto {
  private ResizePhoto() {}

  public static void main(String[] args) throws IOException {
    if (args.length != 4) {
      System.err.println("usage: ResizePhoto PHOTO WIDTH HEIGHT OUT.png");
      System.exit(2);
    }
    BufferedImage photo = ImageIO.read(new File(args[0]));
    if (photo == null) {
      throw new IOException(args[0] + " is not a picture");
    }
    ImagePostProcessNativeEngine engine = new ImagePostProcessNativeEngine();

    // Rows of an NV21 array lie without gaps for widths that are multiples of 16.
    int width = photo.getWidth() / 16 * 16;
    int height = photo.getHeight() / 2 * 2;
    byte[] nv21 = engine.ConvertCS2NV21(toBitmap(photo, width, height));
    if (nv21 == null) {
      throw new IOException("the photo is too small or too large");
    }

    int newWidth = Integer.parseInt(args[1]);
    int newHeight = Integer.parseInt(args[2]);
    Bitmap resized = engine.ConvertCS2Bitmap(nv21, width, height, newWidth, newHeight);
    if (resized == null) {
      throw new IOException("cannot make " + newWidth + " x " + newHeight + " of the photo");
    }
    resized.setHasAlpha(false); // pixels come with alpha 0
    ImageIO.write(toImage(resized), "png", new File(args[3]));
    System.out.println(
        width + " x " + height + " -> " + nv21.length + " bytes of NV21 -> "
            + newWidth + " x " + newHeight + ", " + args[3]);
  }

  private static Bitmap toBitmap(BufferedImage image, int width, int height) {
    int[] colors = image.getRGB(0, 0, width, height, null, 0, width);
    return Bitmap.createBitmap(colors, width, height, Bitmap.Config.ARGB_8888);
  }

  private static BufferedImage toImage(Bitmap bitmap) {
    int width = bitmap.getWidth();
    int height = bitmap.getHeight();
    int[] colors = new int[width * height];
    bitmap.getPixels(colors, 0, width, 0, 0, width, height);
    BufferedImage image = new BufferedImage(width, height, BufferedImage.TYPE_INT_RGB);
    image.setRGB(0, 0, width, height, colors, 0, width);
    return image;
  }
}

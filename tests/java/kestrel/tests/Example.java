package kestrel.tests;

import java.awt.image.BufferedImage;
import java.io.File;
import javax.imageio.ImageIO;

/** Runs the example on a drawn picture and looks at what it saved. */
public final class Example {
  private Example() {}

  public static void main(String[] args) throws Exception {
    File photo = File.createTempFile("photo", ".png");
    File result = File.createTempFile("result", ".png");
    try {
      // Left half red, right half blue, the upper quarter bright; 5 columns and a row too many.
      BufferedImage drawn = new BufferedImage(325, 241, BufferedImage.TYPE_INT_RGB);
      for (int y = 0; y < 241; ++y) {
        for (int x = 0; x < 325; ++x) {
          drawn.setRGB(x, y, y < 60 ? 0xF0F0F0 : x < 160 ? 0xC03020 : 0x2030C0);
        }
      }
      ImageIO.write(drawn, "png", photo);
      Class.forName("ResizePhoto")
          .getMethod("main", String[].class)
          .invoke(null, (Object) new String[] {photo.getPath(), "160", "120", result.getPath()});

      BufferedImage saved = ImageIO.read(result);
      Check.equal(160, saved.getWidth(), "width");
      Check.equal(120, saved.getHeight(), "height");
      Pictures.checkColor(0xF0F0F0, saved.getRGB(20, 10), 3, "the saved picture", 20, 10);
      Pictures.checkColor(0xC03020, saved.getRGB(20, 100), 4, "the saved picture", 20, 100);
      Pictures.checkColor(0x2030C0, saved.getRGB(140, 100), 4, "the saved picture", 140, 100);
    } finally {
      photo.delete();
      result.delete();
    }
  }
}

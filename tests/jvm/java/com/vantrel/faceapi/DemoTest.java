// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import android.graphics.Rect;
import com.vantrel.faceapi.demo.Demo;
import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.imageio.ImageIO;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** The demo says and draws what it found, and is plain about what it cannot use. */
public class DemoTest {
    /** A tight box around the portrait's face. */
    private static final Rect FACE = new Rect(179, 83, 266, 170);
    /** The camera frame is the same on every machine. */
    private static final String FRAME = "f3382a0305e64ec6f00974559a7991bcf013204e62ea7a59f5b4129a0b0e7cc4";

    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private Child demo(File picture, String... model) throws IOException, InterruptedException {
        List<String> arguments = new ArrayList<>();
        arguments.add(picture.getPath());
        arguments.add(new File(folder.getRoot(), "out").getPath());
        arguments.addAll(Arrays.asList(model));
        Child child = Child.run(Demo.class, arguments.toArray(new String[0]));
        assertFalse(child.output, child.output.contains("in native method"));
        return child;
    }

    private static Matcher find(String text, String pattern) {
        Matcher m = Pattern.compile(pattern).matcher(text);
        assertTrue(pattern + " in " + text, m.find());
        return m;
    }

    @Test
    public void thePortrait() throws IOException, InterruptedException {
        Child child = demo(new File(System.getProperty("kyface.source"), "demo/portrait.png"),
                System.getProperty("kyface.landmarks"));
        assertEquals(child.errors.toString(), 0, child.exitStatus);
        assertEquals(FRAME, find(child.output, "frame sha-256 (\\w+)").group(1));
        String box = "\\((\\d+), (\\d+)\\)-\\((\\d+), (\\d+)\\)";
        Matcher m = find(child.output, "\n1 +" + box + " +" + box);
        int[] edges = new int[4];
        for (int i = 0; i < 4; i++) {
            edges[i] = Integer.parseInt(m.group(5 + i));
        }
        Rect found = new Rect(edges[0], edges[1], edges[2], edges[3]);
        assertTrue(found.toString(), Portrait.overlap(found, FACE) >= 0.5);

        // Score, points, yaw, pitch, roll, and the eyes' distance: the face looks at the viewer, tilted a little.
        Matcher pose = find(child.output, "\n1 .*\\) +([\\d.]+) +68 +(-?[\\d.]+) +(-?[\\d.]+) +(-?[\\d.]+) +([\\d.]+)\n");
        for (int i = 2; i <= 4; i++) {
            assertEquals(pose.group(), 0, Float.parseFloat(pose.group(i)), 25);
        }
        int width = Integer.parseInt(m.group(3)) - Integer.parseInt(m.group(1));
        assertEquals(pose.group(), 0.45 * width, Float.parseFloat(pose.group(5)), 0.1 * width);

        BufferedImage drawn = ImageIO.read(new File(folder.getRoot(), "out/faces.png"));
        int left = Integer.parseInt(m.group(1));
        int middle = (Integer.parseInt(m.group(2)) + Integer.parseInt(m.group(4))) / 2;
        assertEquals("the box is drawn", 0xFF50FF78, drawn.getRGB(left, middle));

        find(child.output, "in view in 30 and tracked in 30, as identity \\d+\n");
        // Counted where the faces are drawn: upright, and seen in a mirror.
        find(child.output, "frames of 480 x 640, turned by 270 and mirrored to be shown as 640 x 480, ");
        float margin = Float.parseFloat(find(child.output, "margin[^\n]* (-?[\\d.]+)\n").group(1));
        assertTrue("margin " + margin, margin > 0);
        for (String file : new String[] {"track.png", "face.png", "turned.png"}) {
            assertTrue(file, new File(folder.getRoot(), "out/" + file).length() > 0);
        }
    }

    private void assertRefuses(int exitStatus, String sentence, File picture)
            throws IOException, InterruptedException {
        Child child = demo(picture);
        assertEquals(exitStatus, child.exitStatus);
        assertEquals("", child.output);
        child.errors.removeIf(line -> line.matches("[VDI]/FaceAPI: .*"));
        assertEquals(Arrays.asList(sentence), child.errors);
    }

    /** Two faces of 87 pixels in a frame that has the picture's size, and no landmark model. */
    @Test
    public void twoPortraitsSideBySide() throws IOException, InterruptedException {
        BufferedImage portrait = ImageIO.read(new File(System.getProperty("kyface.source"), "demo/portrait.png"));
        BufferedImage two = new BufferedImage(1024, 512, BufferedImage.TYPE_INT_RGB);
        two.createGraphics().drawImage(portrait, 0, 0, null);
        two.createGraphics().drawImage(portrait, 512, 0, null);
        File file = folder.newFile("two.png");
        ImageIO.write(two, "png", file);
        Child child = demo(file);
        assertEquals(child.errors.toString(), 0, child.exitStatus);
        find(child.output, "1024 x 512, as an NV21 frame of 1024 x 512\n");
        find(child.output, "status 0, 2 faces, drawn in ");
        find(child.output, "\n2 .*\\) +[\\d.]+ +0 +0.0 +0.0 +0.0 +0.0\n");
        String row = " +\\d+ +\\d+ +\\d+ +([\\d.]+)\n";
        Matcher luma = find(child.output, "\nface 1" + row + "face 2" + row);
        assertEquals("luma", Float.parseFloat(luma.group(1)), Float.parseFloat(luma.group(2)), 0.02);
        find(child.output, "in view in 30 and tracked in 30, ");
    }

    /** The frame is written, with what NV21 adds to odd sides, and nothing of an earlier run stays. */
    @Test
    public void aPictureWithoutAFace() throws IOException, InterruptedException {
        File out = folder.newFolder("out");
        for (String name : new String[] {"face.png", "turned.png", "track.png"}) {
            assertTrue(new File(out, name).createNewFile());
        }
        BufferedImage gray = new BufferedImage(301, 199, BufferedImage.TYPE_INT_RGB);
        gray.setRGB(300, 198, 0xFFFFFF);
        File file = folder.newFile("gray.png");
        ImageIO.write(gray, "png", file);
        File faces = new File(out, "faces.png");
        assertRefuses(1, "There is no face in " + file + "; what was searched is in " + faces + ".", file);
        assertArrayEquals(new String[] {"faces.png"}, out.list());
        BufferedImage frame = ImageIO.read(faces);
        assertEquals(302, frame.getWidth());
        assertEquals(200, frame.getHeight());
        assertTrue((frame.getRGB(300, 198) & 0xFF) > (frame.getRGB(299, 197) & 0xFF) + 50);
    }

    @Test
    public void resultsThatCannotBeWritten() throws IOException, InterruptedException {
        File file = folder.newFile("out");
        assertRefuses(3, "The results cannot be written to " + file + ": it is no folder.",
                new File(System.getProperty("kyface.source"), "demo/portrait.png"));
    }

    @Test
    public void aFileThatIsNoPicture() throws IOException, InterruptedException {
        File file = folder.newFile("letter.txt");
        Files.write(file.toPath(), "Dear all".getBytes(StandardCharsets.UTF_8));
        assertRefuses(2, "The file " + file + " is no picture (PNG, JPEG, GIF and BMP are known).", file);
    }

    @Test
    public void aDamagedPicture() throws IOException, InterruptedException {
        byte[] whole = Files.readAllBytes(
                new File(System.getProperty("kyface.source"), "demo/portrait.png").toPath());
        File file = folder.newFile("cut.png");
        Files.write(file.toPath(), Arrays.copyOf(whole, 20000));
        assertRefuses(2, "The picture " + file + " is damaged or cannot be read.", file);
    }

    @Test
    public void aMissingFile() throws IOException, InterruptedException {
        File file = new File(folder.getRoot(), "nothing.png");
        assertRefuses(2, "There is no file " + file + ".", file);
    }
}

// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.FaceVerifier;
import com.vantrel.faceapi.Feature;
import java.io.File;

/**
 * Tells whether the largest faces of two pictures are one person's: {@code Comparison <picture> <picture> <degrees to
 * turn the first clockwise by> <landmark model> [verifier's model]}.
 *
 * <p>Exit status as the demo's: 1 when a picture has no face that can be compared.
 */
public final class Comparison {
    private Comparison() {}

    public static void main(String[] args) {
        FaceLibrary.setDebug(false);
        try {
            System.exit(run(args));
        } catch (UnusablePicture unusable) {
            System.err.println(unusable.getMessage());
            System.exit(2);
        }
    }

    private static int run(String[] args) throws UnusablePicture {
        if (args.length != 4 && args.length != 5) {
            System.err.println("Give two pictures, degrees, a landmark model and, as wanted, a verifier's model.");
            return 2;
        }
        int degrees = Integer.parseInt(args[2]);
        try (Portraits portraits = new Portraits(args[3], args.length > 4 ? args[4] : null)) {
            Feature[] features = new Feature[2];
            for (int i = 0; i < features.length; i++) {
                Picture picture = Picture.read(new File(args[i])).rotated(i == 0 ? degrees : 0);
                Portraits.Portrait portrait = find(portraits, picture);
                features[i] = portrait == null ? null : portraits.feature(portrait);
                if (features[i] == null) {
                    System.err.println("There is no face in " + args[i] + " that can be compared.");
                    return 1;
                }
                System.out.printf("%s: eyes %.1f pixels apart%n", args[i], portrait.face.eyeDist);
            }
            float similarity = features[0].similarityTo(features[1]);
            boolean described = portraits.verifier.version() == EngineValues.DESCRIPTOR_VERSION;
            System.out.printf("similarity %.3f by %s: %s (the threshold is %.2f)%n", similarity,
                    described ? "the descriptor" : "local binary patterns, which say little about persons",
                    similarity >= FaceVerifier.RECOMMENDED_THRESHOLD ? "taken for one person" : "taken for two persons",
                    FaceVerifier.RECOMMENDED_THRESHOLD);
            return 0;
        }
    }

    /** The largest face of a picture, which is reduced when the engine takes none so large; null when there is none. */
    private static Portraits.Portrait find(Portraits portraits, Picture picture) {
        int limit = EngineValues.MAX_FRAME_SIDE;
        int factor = (Math.max(picture.width, picture.height) + limit - 1) / limit;
        if (factor == 1) {
            return portraits.find(picture);
        }
        boolean line = Math.min(picture.width, picture.height) < factor; // of which nothing would be left
        return line ? null : portraits.find(picture.reduced(factor));
    }
}

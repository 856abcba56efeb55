// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import com.vantrel.faceapi.EngineValues;
import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.FaceVerifier;
import com.vantrel.faceapi.Feature;
import java.io.File;

/**
 * Tells whether the largest faces of two pictures are one person's: {@code Comparison <picture> <picture> <landmark
 * model> [verifier's model]}.
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
        if (args.length != 3 && args.length != 4) {
            System.err.println("Give two pictures, a landmark model and, if there is one, a verifier's model.");
            return 2;
        }
        try (Portraits portraits = new Portraits(args[2], args.length > 3 ? args[3] : null)) {
            Feature[] features = new Feature[2];
            for (int i = 0; i < features.length; i++) {
                Portraits.Portrait portrait = portraits.find(Picture.read(new File(args[i])));
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
}

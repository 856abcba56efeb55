// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

import com.vantrel.faceapi.FaceLibrary;
import com.vantrel.faceapi.FaceVerifier;
import com.vantrel.faceapi.Feature;
import java.io.File;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;

/**
 * How well a verifier tells persons apart: {@code Figures <folder> <landmark model> [verifier's model]}. The folder has
 * a folder of pictures for each person. Prints the rates of error over all pairs, for the pictures as they are and
 * reduced.
 */
public final class Figures {
    private static final int[] REDUCTIONS = {1, 2, 3, 4};

    private Figures() {}

    public static void main(String[] args) {
        if (args.length != 2 && args.length != 3) {
            System.err.println("Give a folder with a folder for each person, a landmark model and a verifier's model.");
            System.exit(2);
        }
        FaceLibrary.setDebug(false);
        try (Portraits portraits = new Portraits(args[1], args.length > 2 ? args[2] : null)) {
            List<Portraits.Portrait> faces = new ArrayList<>();
            List<File> persons = new ArrayList<>();
            int pictures = 0;
            for (File person : sorted(new File(args[0]))) {
                for (File file : person.isDirectory() ? sorted(person) : new File[0]) {
                    pictures++;
                    Portraits.Portrait face = portraits.find(Picture.read(file));
                    if (face != null) {
                        faces.add(face);
                        persons.add(person);
                    }
                }
            }
            System.out.printf("%d pictures, a face in %d of them%n%n", pictures, faces.size());
            System.out.printf("%10s  %5s  %10s  %10s  %6s  %6s  %14s  %14s%n", "eyes, px", "faces", "same pairs",
                    "other pairs", "AUC", "EER", "false rejects", "false accepts");
            for (int reduction : REDUCTIONS) {
                print(portraits, faces, persons, reduction);
            }
        } catch (UnusablePicture unusable) {
            System.err.println(unusable.getMessage());
            System.exit(2);
        }
    }

    private static File[] sorted(File folder) {
        File[] files = folder.listFiles();
        if (files == null) {
            return new File[0];
        }
        Arrays.sort(files);
        return files;
    }

    private static void print(
            Portraits portraits, List<Portraits.Portrait> faces, List<File> persons, int reduction) {
        List<Feature> features = new ArrayList<>();
        List<File> names = new ArrayList<>();
        double eyes = 0;
        for (int i = 0; i < faces.size(); i++) {
            Portraits.Portrait face = faces.get(i).reduced(reduction);
            Feature feature = portraits.feature(face);
            if (feature != null) {
                features.add(feature);
                names.add(persons.get(i));
                eyes += face.face.eyeDist;
            }
        }
        List<Float> same = new ArrayList<>();
        List<Float> other = new ArrayList<>();
        for (int i = 0; i < features.size(); i++) {
            for (int k = 0; k < i; k++) {
                (names.get(i).equals(names.get(k)) ? same : other).add(features.get(i).similarityTo(features.get(k)));
            }
        }
        if (same.isEmpty() || other.isEmpty()) {
            System.out.printf("%10s  %5d  too few to compare%n", "1/" + reduction, features.size());
            return;
        }
        System.out.printf("%10.1f  %5d  %10d  %11d  %6.4f  %6.4f  %13.2f%%  %13.2f%%%n", eyes / features.size(),
                features.size(), same.size(), other.size(), areaUnderCurve(same, other), equalErrorRate(same, other),
                100 * below(same, FaceVerifier.RECOMMENDED_THRESHOLD),
                100 * (1 - below(other, FaceVerifier.RECOMMENDED_THRESHOLD)));
    }

    /** The share of values below a threshold. */
    private static double below(List<Float> values, float threshold) {
        return (double) values.stream().filter(value -> value < threshold).count() / values.size();
    }

    /** How often a pair of one person is more alike than one of two; an equal pair counts half. */
    private static double areaUnderCurve(List<Float> same, List<Float> other) {
        double wins = 0;
        for (float s : same) {
            for (float o : other) {
                wins += s > o ? 1 : s == o ? 0.5 : 0;
            }
        }
        return wins / same.size() / other.size();
    }

    /** The least that the larger of both rates of error can be. */
    private static double equalErrorRate(List<Float> same, List<Float> other) {
        double least = 1;
        for (int i = 0; i <= 1000; i++) {
            float threshold = i / 1000f;
            least = Math.min(least, Math.max(below(same, threshold), 1 - below(other, threshold)));
        }
        return least;
    }
}

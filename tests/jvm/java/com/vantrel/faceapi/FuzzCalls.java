// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.util.Random;

/**
 * {@link RandomCalls} whose choices are a fuzzer's: what it finds to reach more of the classes it tries further. Run by
 * {@code scripts/fuzz --java}, over the agent that puts fences around what native code borrows.
 */
public final class FuzzCalls {
    private static final int MOST_CALLS = 16;

    /** Chooses by the bytes of an input, and after them always in the same way. */
    private static final class Choices extends Random {
        private static final long serialVersionUID = 1;
        private byte[] bytes = new byte[0];
        private int next;

        void take(byte[] input) {
            bytes = input;
            next = 0;
            setSeed(1);
        }

        boolean atEnd() {
            return next >= bytes.length;
        }

        @Override
        protected int next(int bits) {
            if (bytes == null || atEnd()) { // the superclass chooses before there are any
                return super.next(bits);
            }
            int value = 0;
            for (int taken = 0; taken < bits && !atEnd(); taken += 8) {
                value = value << 8 | bytes[next++] & 0xff;
            }
            return value & (int) ((1L << bits) - 1);
        }
    }

    private static final Choices CHOICES = new Choices();
    private static RandomCalls calls;

    private FuzzCalls() {}

    /** What the fuzzer calls. */
    public static void fuzzerTestOneInput(byte[] input) throws Exception {
        if (calls == null) {
            FaceLibrary.setDebug(false);
            calls = new RandomCalls(CHOICES);
        }
        CHOICES.take(input);
        for (int i = 0; i < MOST_CALLS && !CHOICES.atEnd(); i++) {
            calls.run(1);
        }
        if (RandomCalls.openLoans() != 0) {
            throw new AssertionError("arrays were not given back: " + RandomCalls.openLoans());
        }
    }
}

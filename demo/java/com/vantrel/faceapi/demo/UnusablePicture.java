// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.demo;

/** A picture that cannot be used; the message is a sentence for whoever gave it. */
final class UnusablePicture extends Exception {
    private static final long serialVersionUID = 1L;

    UnusablePicture(String sentence) {
        super(sentence);
    }
}

// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import org.jetbrains.annotations.NotNull;

/** The face engine refused a call or failed. The message has the name that {@link EngineProfile} gives the code. */
public final class FaceEngineException extends RuntimeException {
    /** The code of a failure for which the engine's own code is not known, such as that of creating an object. */
    public static final int UNKNOWN_CODE = Integer.MIN_VALUE;

    private static final long serialVersionUID = 1;

    private final int code;

    FaceEngineException(@NotNull String call, @NotNull EngineProfile profile, int code) {
        super(call + " failed: " + profile.describe(code));
        this.code = code;
    }

    /** A failure whose code the engine keeps to itself. */
    FaceEngineException(@NotNull String call) {
        super(call + " failed");
        code = UNKNOWN_CODE;
    }

    /**
     * Returns the engine's result code.
     *
     * @return the code, never 0; {@link #UNKNOWN_CODE} when it is not known
     */
    public int code() {
        return code;
    }
}

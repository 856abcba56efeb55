// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.lang.ref.PhantomReference;
import java.lang.ref.ReferenceQueue;
import java.util.Collections;
import java.util.HashSet;
import java.util.Set;

/**
 * An engine object that is destroyed exactly once: when its owner is closed, or some time after the owner was forgotten.
 *
 * <p>Whoever calls native code with {@link #value()} holds this object's monitor from before it reads the value until
 * the call has returned; closing takes the monitor too. So a handle in use is never destroyed, and a destroyed one
 * never used.
 */
final class EngineHandle extends PhantomReference<Object> {
    /** Destroys an engine object. */
    interface Destroyer {
        void destroy(long handle);
    }

    private static final ReferenceQueue<Object> FORGOTTEN = new ReferenceQueue<>();

    /** Keeps the handles of forgotten owners reachable until the queue delivers them. */
    private static final Set<EngineHandle> LIVE = Collections.synchronizedSet(new HashSet<EngineHandle>());

    static {
        Thread reclaimer = new Thread(EngineHandle::reclaim, "FaceAPI reclaimer");
        reclaimer.setDaemon(true);
        reclaimer.start();
    }

    private final String kind;
    private final Destroyer destroyer;
    private long value;

    private EngineHandle(Object owner, String kind, long value, Destroyer destroyer) {
        super(owner, FORGOTTEN);
        this.kind = kind;
        this.value = value;
        this.destroyer = destroyer;
    }

    /** Takes charge of {@code value} for {@code owner}; the destroyer must not refer to the owner. */
    static EngineHandle own(Object owner, String kind, long value, Destroyer destroyer) {
        if (value == 0) {
            throw new FaceEngineException("creating a " + kind);
        }
        EngineHandle handle = new EngineHandle(owner, kind, value, destroyer);
        LIVE.add(handle);
        return handle;
    }

    /** The engine's handle. The caller holds the monitor. */
    long value() {
        if (value == 0) {
            throw new IllegalStateException("the " + kind + " is closed");
        }
        return value;
    }

    /** Destroys the engine object unless that has been done; waits for a call in progress. */
    synchronized void destroy() {
        if (value != 0) {
            long last = value;
            value = 0;
            LIVE.remove(this);
            destroyer.destroy(last);
        }
    }

    /** The number of engine objects that exist, for tests. */
    static int liveCount() {
        return LIVE.size();
    }

    private static void reclaim() {
        while (true) {
            try {
                ((EngineHandle) FORGOTTEN.remove()).destroy();
            } catch (InterruptedException ignored) {
                // Nobody has a reason to interrupt this thread; it lives as long as the process.
            }
        }
    }
}

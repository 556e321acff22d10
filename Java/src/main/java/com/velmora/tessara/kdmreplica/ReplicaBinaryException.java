package com.velmora.tessara.kdmreplica;

/**
 * Thrown by {@code Replica.getReplicaFromBinary} for bytes that are not a readable binary replica:
 * truncated, corrupted, hostile (impossible lengths or counts, a stream that inflates too far), read
 * with the wrong compression flag, or describing an invalid schema or data. The message says what
 * is wrong and where: an offset in the buffer for the header, an offset in the payload (the bytes
 * after the header, once inflated) for the rest.
 */
public class ReplicaBinaryException extends IllegalArgumentException {
    private static final long serialVersionUID = 1L;

    private final long offset;
    private final boolean inPayload;

    /**
     * @param what      what is wrong
     * @param offset    where
     * @param inPayload whether {@code offset} counts from the start of the payload rather than of
     *                  the buffer
     * @param cause     the underlying failure, or null
     */
    public ReplicaBinaryException(String what, long offset, boolean inPayload, Throwable cause) {
        super("binary replica: " + what + " (at offset " + offset + (inPayload ? " of the payload)" : " of the buffer)"),
                cause);
        this.offset = offset;
        this.inPayload = inPayload;
    }

    /** The offset where the problem was found. */
    public long getOffset() {
        return offset;
    }

    /** True when {@link #getOffset()} counts from the start of the payload, false from the buffer's. */
    public boolean isPayloadOffset() {
        return inPayload;
    }
}

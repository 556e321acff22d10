package com.velmora.tessara.kdmreplica;

import java.util.List;

/**
 * Thrown by {@code Replica.commit} when the replica breaks its schema: the message lists every
 * violation (up to {@code Replica.MAX_LISTED_VIOLATIONS}, then the count of the others), one a line.
 */
public class ReplicaCommitException extends IllegalStateException {
    private static final long serialVersionUID = 1L;

    private final List<String> violations;
    private final int total;

    public ReplicaCommitException(String replicaName, List<String> violations, int total) {
        super(message(replicaName, violations, total));
        this.violations = List.copyOf(violations);
        this.total = total;
    }

    private static String message(String replicaName, List<String> violations, int total) {
        StringBuilder b = new StringBuilder("commit of replica '").append(replicaName).append("' refused: ")
                .append(total).append(total == 1 ? " violation" : " violations");
        for (String v : violations) {
            b.append("\n - ").append(v);
        }
        if (total > violations.size()) {
            b.append("\n - and ").append(total - violations.size()).append(" more");
        }
        return b.toString();
    }

    /** The violations listed (at most {@code Replica.MAX_LISTED_VIOLATIONS}). */
    public List<String> getViolations() {
        return violations;
    }

    /** The number of violations found, listed or not. */
    public int getViolationCount() {
        return total;
    }
}

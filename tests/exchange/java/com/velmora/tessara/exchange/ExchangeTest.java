package com.velmora.tessara.exchange;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.ReplicaHolder;
import com.velmora.tessara.kdmreplica.Replica;
import org.junit.jupiter.api.Test;

/** Java as the host: replicas cross into native code and come back as the same objects. */
class ExchangeTest {

    @Test
    void aReplicaComesBackAsTheSameObject() {
        Replica replica = new Replica("exchanged");
        assertSame(replica, ExchangeNatives.roundTrip(replica), ExchangeNatives.lastError());
        assertTrue(ExchangeNatives.unbuiltGivesNull(), ExchangeNatives.lastError());
    }

    @Test
    void holdersAreFilledOrMadeAndReadBack() {
        Replica replica = new Replica("held");
        ReplicaHolder made = ExchangeNatives.toHolder(replica, null);
        assertNotNull(made, ExchangeNatives.lastError());
        assertSame(replica, made.getValue());

        ReplicaHolder given = new ReplicaHolder();
        assertSame(given, ExchangeNatives.toHolder(replica, given), ExchangeNatives.lastError());
        assertSame(replica, given.getValue());

        assertSame(replica, ExchangeNatives.fromHolder(given), ExchangeNatives.lastError());
        assertNull(ExchangeNatives.fromHolder(null), "a null holder fails");
        assertTrue(ExchangeNatives.lastError().contains("VLXKDMReplica::BuildFromJavaHolder(JNIEnv*, jobject)"),
                ExchangeNatives.lastError());
    }

    @Test
    void theOrdinaryFrameWorksOnAJavaThread() {
        Replica replica = new Replica("before");
        assertEquals("after", ExchangeNatives.renameThroughNative(replica, "after"), ExchangeNatives.lastError());
        assertEquals("after", replica.getName());
    }
}

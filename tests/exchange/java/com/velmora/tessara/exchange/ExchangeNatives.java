package com.velmora.tessara.exchange;

import com.velmora.tessara.ReplicaHolder;
import com.velmora.tessara.kdmreplica.Replica;

/** Native methods that hand replicas to the native library and take them back. */
final class ExchangeNatives {
    static {
        System.loadLibrary("corvexa_exchange_test");
    }

    private ExchangeNatives() {
    }

    static native Replica roundTrip(Replica replica);

    static native ReplicaHolder toHolder(Replica replica, ReplicaHolder holderOrNull);

    static native Replica fromHolder(ReplicaHolder holder);

    static native String renameThroughNative(Replica replica, String name);

    static native boolean unbuiltGivesNull();

    static native String lastError();
}

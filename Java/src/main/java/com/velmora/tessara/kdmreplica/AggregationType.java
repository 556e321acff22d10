package com.velmora.tessara.kdmreplica;

/**
 * How a relationship attribute holds its target instances. Removing an instance also removes the
 * instances it holds through a {@code Composition} attribute; {@code Shared} targets are left alone.
 */
public enum AggregationType {
    Composition, Shared
}

package com.velmora.tessara.kdmreplica;

/** The value type of an attribute definition. */
public enum AttributeType {
    Integer, Double, String, Date, Boolean, Binary, Relationship
}

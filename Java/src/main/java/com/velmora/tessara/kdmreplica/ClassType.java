package com.velmora.tessara.kdmreplica;

/** The kind of a class definition. */
public enum ClassType {
    Class, Extension
}

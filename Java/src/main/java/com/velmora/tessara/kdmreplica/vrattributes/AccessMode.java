package com.velmora.tessara.kdmreplica.vrattributes;

/**
 * Access mode of an attribute. An attribute in mode {@code Read} is read-only for
 * {@code Instance.setValue} and {@code Instance.clearValue}; documents still fill it.
 */
public enum AccessMode {
    Read, Write, ReadWrite
}

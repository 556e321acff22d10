package com.velmora.tessara.kdmreplica.vrattributes;

/** Software visibility of a class or attribute definition (stored, not enforced). */
public enum Visibility {
    Public, Protected, Private
}

// The target that owns the precompiled header needs one file of its own.

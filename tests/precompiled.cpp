// A target of precompiled headers has to have a source.

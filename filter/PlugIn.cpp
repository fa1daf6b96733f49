// The plug-in module. Everything it exports is defined in the filter library, which is
// linked into the module whole: the version symbols, the log handles, the internal-build
// test, getCosineThetas and the factory OrvaneServiceFilterPlugIn.

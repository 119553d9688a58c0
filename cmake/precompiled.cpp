// Compiles the shared precompiled header (cmake/PrecompiledHeaders.cmake); no code of its own.

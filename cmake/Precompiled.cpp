// The source of the targets that only precompile headers.

// Placeholder until the POSIX layer lands.

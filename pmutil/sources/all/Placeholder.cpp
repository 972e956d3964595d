// Gives the library a source until its first module lands.

// Gives the precompiled headers of all tests a target to be made for.

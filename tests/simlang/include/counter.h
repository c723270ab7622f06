// A test header.
#define THREE 3

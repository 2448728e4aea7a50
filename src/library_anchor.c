/* The shared library is made of the whole core archive; a target needs at least one source. */
typedef int kelstat_library_anchor;

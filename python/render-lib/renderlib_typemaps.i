// Custom typemaps of the module, named by what the argument means. SWIG's own
// typemaps serve everywhere else.
//
// Who frees what:
// | typemap          | memory                         | freed by                         |
// |------------------|--------------------------------|----------------------------------|
// | EngineHeapText   | a text member of an engine     | the engine, with free(); the old |
// |                  | record, on the C heap          | value here when it is replaced   |

// char *EngineHeapText
// A text member that the engine releases with free(). Assignment frees the old
// text and stores a malloc'd copy of exactly strlen + 1 bytes (None stores
// null), so engine and module agree on the heap.
%typemap(memberin, noblock=1) char *EngineHeapText {
  {
    char *copy = 0;
    if ($input) {
      size_t size = strlen((const char *)$input) + 1;
      copy = (char *)malloc(size);
      if (!copy)
        SWIG_exception_fail(SWIG_MemoryError, "out of memory copying a parameter name");
      memcpy(copy, $input, size);
    }
    free($1);
    $1 = copy;
  }
}

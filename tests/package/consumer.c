#include <stdio.h>
#include <stdlib.h>
#include "zelcv.h"

int main(void) {
  const ZelLibraryVersion* v = zelcvGetLibVersion();
  printf("%s %s\n", v->name, v->version);

  /* A library-built state is released by its Free function; Free checks. */
  ZelStatus s = zeliMorphologyFree(NULL);
  printf("Free(NULL) -> %d (zelStatusNullPointer is %d)\n", (int)s, (int)zelStatusNullPointer);
  return s == zelStatusNullPointer ? EXIT_SUCCESS : EXIT_FAILURE;
}

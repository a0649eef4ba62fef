/* A user of the installed library: calls one routine through its frame. */
#include <stdio.h>
#include <string.h>

#include "orvclifn.h"

int main(void) {
  int32_t count = 3;
  char out[CLI_TEXT_LIMIT + 1];
  int16_t countNull = 0, outNull = 0;
  char sqlstate[CLI_SQLSTATE_SIZE] = {0};
  char message[CLI_MESSAGE_SIZE] = {0};
  CLI_udfSPACE(&count, out, &countNull, &outNull, sqlstate, "SPACE", "SPACE", message);
  if (strcmp(out, "   ") != 0 || sqlstate[0] != '\0') {
    fprintf(stderr, "SPACE(3) gave [%s], SQLSTATE [%s]\n", out, sqlstate);
    return 1;
  }
  puts("SPACE(3) through the installed library: ok");
  return 0;
}

/* Demo program for Kestrelgauge: a tiny word counter with a few uncovered paths. */
#include <stdio.h>
#include <string.h>

#include "../util/text.h"

static int usage(const char *prog) {
  fprintf(stderr, "usage: %s [-u] WORD...\n", prog); /* kestrel: tested */
  return 2;
}

int main(int argc, char **argv) {
  int upper = 0;
  int first = 1;
  if (argc > 1 && strcmp(argv[1], "-u") == 0) {
    upper = 1;
    first = 2;
  }
  if (first >= argc) return usage(argv[0]);
  struct word_stats stats;
  stats_init(&stats);
  for (int i = first; i < argc; i++) {
    char buf[256];
    if (strlen(argv[i]) >= sizeof buf) {
      /* kestrel: begin deadcode */
      fprintf(stderr, "word too long\n");
      continue;
      /* kestrel: end */
    }
    strcpy(buf, argv[i]);
    if (upper) to_upper(buf);
    stats_add(&stats, buf);
    printf("%s\n", buf);
  }
  stats_print(&stats);
  return 0;
}

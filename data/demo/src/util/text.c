/* Text helpers of the demo program: statistics and case conversion. */
#include "text.h"

#include <ctype.h>
#include <stdio.h>
#include <string.h>

void stats_init(struct word_stats *s) { memset(s, 0, sizeof *s); }

int is_vowel(char c) {
  switch (tolower((unsigned char)c)) {
    case 'a': case 'e': case 'i': case 'o': case 'u':
      return 1;
    default:
      return 0;
  }
}

void stats_add(struct word_stats *s, const char *word) {
  int n = (int)strlen(word);
  s->words++;
  s->letters += n;
  if (n > s->longest) s->longest = n;
  for (const char *p = word; *p; p++)
    if (is_vowel(*p)) s->vowels++;
  if (palindrome(word)) {
    printf("(%s is a palindrome)\n", word);
  }
}

void stats_print(const struct word_stats *s) {
  printf("%d words, %d letters, %d vowels, longest %d\n", s->words, s->letters, s->vowels,
         s->longest);
  if (s->words == 0) {
    printf("no words at all\n"); /* kestrel: inspected */
  }
}

void to_upper(char *text) {
  for (; *text; text++) *text = (char)toupper((unsigned char)*text);
}

int palindrome(const char *word) {
  size_t n = strlen(word);
  if (n < 2) return 0;
  for (size_t i = 0; i < n / 2; i++)
    if (word[i] != word[n - 1 - i]) return 0;
  return 1;
}

/* Never called: the demo shows it as an unused function. */
int count_char(const char *text, char c) {
  int k = 0;
  for (; *text; text++)
    if (*text == c) k++;
  return k;
}

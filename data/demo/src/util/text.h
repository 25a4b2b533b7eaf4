/* Text helpers of the demo program. */
#ifndef DEMO_TEXT_H
#define DEMO_TEXT_H

struct word_stats {
  int words;
  int letters;
  int longest;
  int vowels;
};

void stats_init(struct word_stats *s);
void stats_add(struct word_stats *s, const char *word);
void stats_print(const struct word_stats *s);
void to_upper(char *text);
int is_vowel(char c);
int palindrome(const char *word);

#endif

int f(void) {
  if (x) abort(); /* kestrel: deadcode */
  /* kestrel: begin tested */
  g();
  /* kestrel: end */
}

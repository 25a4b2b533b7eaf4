// Merging (filled in below).

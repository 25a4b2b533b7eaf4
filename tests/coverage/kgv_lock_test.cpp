// Locks (filled in below).

// Host configuration files and metadata lists.
//
// A metadata list is a null-terminated array of "KEY=VALUE" strings (char**), grown by SetAuxEntry and released
// with DestroyStringList. A null list is an empty list.
#pragma once

// Finds `name` in `$NITF_HOME/<dir>`, then in `<install prefix>/<dir>`, then in `./<dir>`; returns a new path
// (release with free) or null.
char* IMPFindFile(const char* dir, const char* name);

// Reads key/value lines ("KEY=VALUE" or "KEY: VALUE"; blank lines and lines starting with # are skipped) into
// a new list; null when the file cannot be read.
char** TextFileToStringList(const char* path);

// The value stored under `key` (compared without regard to case), or null.
const char* FetchAuxEntry(char** list, const char* key);

// Sets `key` to `value`, replacing an earlier value of the same key; returns the (possibly moved) list.
char** SetAuxEntry(char** list, const char* key, const char* value);

// Number of entries in the list.
int CountStringList(char** list);

void DestroyStringList(char** list);

// Current local date or time as text into `out` (at least 20 bytes); returns `out`.
//   format 11: "DD/MM/YYYY"    format 12: "hh:mm:ss"
// Other formats give an empty text.
char* IMPTime(char* out, int format);

/* A satellite string library as a translator would ship it: it replaces two
   texts and leaves the rest to the built-in table. */
#include <stddef.h>

__attribute__((visibility("default"))) const char *TessarineLocString(int id) {
    switch (id) {
        case 16386: return "Speicher reicht nicht.";
        case 16384: return "Fehler erkannt; Vorgang abgebrochen.";
        default: return NULL;
    }
}

/*
 * A host that provides the operations (see host_stubs.c.in) and does nothing with them: opens the
 * library and finds its functions.
 *
 *     dlopen_host LIBRARY SYMBOLS_FILE     succeeds when all symbols of the file are found
 *     dlopen_host LIBRARY --lacks NAME     succeeds when the library is refused for want of NAME
 */
#define _GNU_SOURCE
#include <dlfcn.h>
#include <stdio.h>
#include <string.h>

static int refused_for_want_of(const char *library, const char *name)
{
    const char *error = NULL;
    char expected[256];

    if (dlopen(library, RTLD_NOW | RTLD_LOCAL) != NULL) {
        fprintf(stderr, "%s was opened without %s\n", library, name);
        return 1;
    }
    error = dlerror();
    snprintf(expected, sizeof expected, "undefined symbol: %s", name);
    if (strstr(error, expected) == NULL) {
        fprintf(stderr, "the error does not name %s: %s\n", name, error);
        return 1;
    }
    return 0;
}

static int finds_all_of(const char *library, const char *symbols_file)
{
    void *const handle = dlopen(library, RTLD_NOW | RTLD_LOCAL);
    FILE *const symbols = fopen(symbols_file, "r");
    char name[256];
    int found = 0;

    if (handle == NULL || symbols == NULL) {
        fprintf(stderr, "%s\n", handle == NULL ? dlerror() : symbols_file);
        return 1;
    }
    while (fscanf(symbols, "%255s", name) == 1) {
        if (dlvsym(handle, name, "OVMD_1") == NULL) {
            fprintf(stderr, "%s\n", dlerror());
            return 1;
        }
        ++found;
    }
    fclose(symbols);
    return found > 0 && dlclose(handle) == 0 ? 0 : 1;
}

int main(int argc, char **argv)
{
    if (argc == 3) {
        return finds_all_of(argv[1], argv[2]);
    }
    if (argc == 4 && strcmp(argv[2], "--lacks") == 0) {
        return refused_for_want_of(argv[1], argv[3]);
    }
    fprintf(stderr, "usage: dlopen_host LIBRARY SYMBOLS_FILE | LIBRARY --lacks NAME\n");
    return 2;
}

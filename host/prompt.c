/* Reference host: the question asked when a converter is missing.
 *
 * Asks on the terminal when standard input is one. Otherwise answers from the
 * environment variable TEXTCONV_HOST_ANSWER: "no", "n" or "0" declines (the
 * library then ends the process), anything else, or no value, continues. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <strings.h>
#include <unistd.h>

#include "textconv.h"

static int answer_is_no(const char *answer) {
    while (*answer == ' ' || *answer == '\t') ++answer;
    return strcasecmp(answer, "no") == 0 || strcasecmp(answer, "n") == 0 || strcmp(answer, "0") == 0 ||
           strncasecmp(answer, "no\n", 3) == 0 || strncasecmp(answer, "n\n", 2) == 0;
}

int UIYesNoDisplay(uint32_t question, uint32_t a, uint32_t b, const char *fromName, const char *toName) {
    (void)question;
    (void)a;
    (void)b;
    if (isatty(STDIN_FILENO)) {
        char line[64];
        fprintf(stderr, "No converter from %s to %s on this system. Continue without it? [Y/n] ",
                fromName ? fromName : "?", toName ? toName : "?");
        fflush(stderr);
        if (!fgets(line, sizeof line, stdin)) return 1;
        return !answer_is_no(line);
    }
    const char *setting = getenv("TEXTCONV_HOST_ANSWER");
    return !(setting && answer_is_no(setting));
}


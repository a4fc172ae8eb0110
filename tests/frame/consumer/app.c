/* A host application built against an installed copy: the CMake package and
 * the reference host, one conversion, the pkg-config file checked by the
 * test script. */
#include <stdio.h>
#include <string.h>
#include <textconv.h>

int main(void) {
    uint16_t units[4];
    uint32_t length = sizeof units;
    if (!StringFromUTF8ToUnicode("h\xc3\xa9", units, &length) || length != 6 || units[1] != 0xE9) return 1;
    return strcmp(version_info, "@(#)2012-07-20 13:02:10 BST") != 0;
}

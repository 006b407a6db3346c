#include <fileindex/fileidx.h>

#include <stdio.h>
int main(void) {
    return puts(FILEIDXIsPathIndexed("/photo/2015/beach.jpg") ? "indexed" : "not indexed") < 0;
}
// Output:
// indexed

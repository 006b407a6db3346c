#include <fileindex/fileidx.h>

#include <stdio.h>

int main(void) {
    char path[16] = "untouched";
    if (FILEIDXIsPathIndexed("/photo/2015") != 1 || FILEIDXIsPathIndexed("/photo/20150") != 0 ||
        FILEIDXIsShareIndexed("photo") != 1 || FILEIDXIsPathIndexed(NULL) != 0 ||
        FILEIDXQueuePathGet("no such share", path, sizeof path) != -1) {
        puts("wrong answer");
        return 1;
    }
    puts("consumer in C: good");
    return 0;
}

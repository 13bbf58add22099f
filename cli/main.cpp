// vantor-pim-syncctl: the command line of vantor-pim-sync.
#include "Commands.h"

int main(int argc, char** argv) {
    return runCommandLine(argc, argv);
}

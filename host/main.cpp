#include "host/cli/command_line.h"

int main(int argc, char** argv)
{
    return tav::run(argc, argv);
}

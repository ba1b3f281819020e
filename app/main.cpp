// The desktop program's entry point.
#include "Startup.h"

int main(int argc, char **argv)
{
    Solution::Startup startup;
    return startup.run(argc, argv);
}

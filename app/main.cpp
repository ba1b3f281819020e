// The desktop program's entry point.
#include "app/Startup.h"

int main(int argc, char **argv)
{
    Solution::Startup startup;
    return startup.run(argc, argv);
}

// receiver [--json] FILE: shows what a transport stream carries.
#include "Receiver.h"

int main(int argc, char **argv) {
    return receiver::RunReceiver(std::vector<std::string>(argv + (argc > 0 ? 1 : 0), argv + argc),
                                 stdout, stderr);
}

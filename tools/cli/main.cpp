#include <csignal>
#include <iostream>

#include "commands.h"

namespace {

void OnInterrupt(int) { tessarine::cli::RequestStop(); }

}  // namespace

int main(int argc, char **argv) {
    struct sigaction action {};
    action.sa_handler = OnInterrupt;
    sigemptyset(&action.sa_mask);
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
    std::ios::sync_with_stdio(false);
    return tessarine::cli::RunTool(argc, argv, std::cout, std::cerr);
}

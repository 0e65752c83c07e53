// SPDX-License-Identifier: Apache-2.0
#include "Cli/CommandLine.h"

int main(int argc, char** argv) {
    return cli::runCommandLine(argc, argv);
}

// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

// A test started by hand, outside ctest, would write into the real home,
// /usr/share and the user's session bus. Such a start re-runs itself through
// sandbox.sh, which sets THEMELET_SANDBOX.
#include <QtGlobal>

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <unistd.h>
#include <vector>

// glibc hands the program's arguments to the functions of .init_array.
__attribute__((constructor)) static void enterSandbox(int argc, char **argv, char **)
{
    if (qEnvironmentVariableIsSet("THEMELET_SANDBOX"))
        return;
    char exe[PATH_MAX];
    const ssize_t size = readlink("/proc/self/exe", exe, sizeof(exe) - 1);
    if (size <= 0)
        std::abort();
    exe[size] = '\0';
    std::vector<char *> args { const_cast<char *>(THEMELET_SANDBOX_SCRIPT), exe };
    args.insert(args.end(), argv + 1, argv + argc);
    args.push_back(nullptr);
    execv(args[0], args.data());
    std::perror("cannot run the test in its sandbox");
    std::abort();
}

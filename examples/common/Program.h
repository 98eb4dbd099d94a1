// What the programs have in common at their front: options, one line on standard error for anything wrong, exit status 1 then.
#ifndef KEL_EXAMPLES_PROGRAM_H
#define KEL_EXAMPLES_PROGRAM_H

#include <CLI/CLI.hpp>
#include <exception>
#include <functional>
#include <iostream>
#include <string>

namespace kel_examples {

// Parses the options and runs `body`, whose result is the exit status.
inline int runProgram(CLI::App& app, int argc, char** argv, const std::function<int()>& body) {
    app.failure_message([](const CLI::App* a, const CLI::Error& error) { return a->get_name() + ": " + error.what() + "\n"; });
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? 0 : 1;
    }
    try {
        return body();
    } catch (const std::exception& error) {
        std::cerr << app.get_name() << ": " << error.what() << '\n';
        return 1;
    }
}

} // namespace kel_examples

#endif

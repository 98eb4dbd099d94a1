// What the programs have in common at their front: options, one line on standard error for anything wrong, exit status 1 then.
#ifndef KEL_EXAMPLES_PROGRAM_H
#define KEL_EXAMPLES_PROGRAM_H

#include <CLI/CLI.hpp>
#include <cstdlib>
#include <exception>
#include <functional>
#include <iostream>
#include <kel/kelImage.h>
#include <new>
#include <sstream>
#include <string>

#include "Output.h"

namespace kel_examples {

// A number from least to most, both included; unlike CLI::Range it takes no "nan".
inline CLI::Validator numberIn(double least, double most) {
    std::ostringstream range;
    range << '[' << least << " - " << most << ']';
    const auto check = [least, most, range = range.str()](const std::string& text) {
        char* end;
        const double value = std::strtod(text.c_str(), &end);
        return end != text.c_str() && !*end && value >= least && value <= most ? ""
                                                                               : "Value " + text + " not in range " + range;
    };
    return CLI::Validator(check, range.str());
}

// Parses the options and runs `body`, whose result is the exit status.
inline int runProgram(CLI::App& app, int argc, char** argv, const std::function<int()>& body) {
    prepareProcess();
    std::string name = argc > 0 ? argv[0] : ""; // as it is called: installed programs have a name of their own
    if (name.find('/') != std::string::npos)
        name.erase(0, name.rfind('/') + 1);
    if (!name.empty())
        app.name(name);
    app.set_version_flag("--version", app.get_name() + " (kel) " KEL_VERSION);
    app.failure_message([](const CLI::App* a, const CLI::Error& error) { return a->get_name() + ": " + error.what() + "\n"; });
    const auto complain = [&](const char* what) {
        showProgress("");
        std::cerr << app.get_name() << ": " << what << '\n';
        return 1;
    };
    try {
        int status;
        try {
            app.parse(argc, argv);
            status = body();
        } catch (const CLI::ParseError& error) {
            status = app.exit(error) == 0 ? 0 : 1;
        }
        showProgress("");
        flushResults();
        return status;
    } catch (const std::bad_alloc&) {
        return complain("not enough memory");
    } catch (const std::exception& error) {
        return complain(error.what());
    }
}

} // namespace kel_examples

#endif

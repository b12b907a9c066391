// Where a password comes from: a file, standard input, or the terminal, but never the argument list.
#pragma once

#include <string>

#include "Interrupt.h"

namespace zo {

/// The first line of a file.
std::string PasswordFromFile(const std::string& inPath);
/// The first line of standard input.
std::string PasswordFromStandardInput(const Interrupt& inInterrupt);

/// Asks on the terminal. The answer is shown while it is typed.
std::string AskOnTerminal(const std::string& inQuestion, const Interrupt& inInterrupt);
/// Asks on the terminal with echo off; the terminal is put right again in every case.
std::string AskPassword(const std::string& inQuestion, const Interrupt& inInterrupt);

}  // namespace zo

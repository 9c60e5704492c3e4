// The three modes of the program. Exactly one runs, on the main thread, and returns when it is done.
#pragma once

#include "app/command_line.h"

// Collects when "c" or "collect" is given, then decrypts when "d" or "decrypt" is given.
void NoGui(const ArgumentMap& arguments);

// The interactive mode.
void WithGui(const ArgumentMap& arguments);

// The monitoring mode; takes nothing from the command line.
void Testing();

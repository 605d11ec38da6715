// What the figures were taken on.
#pragma once

#include <string>

// Several lines: processor, memory, kernel, and the file system behind the folder.
std::string DescribeMachine( const std::string& i_rFolder );

// Text for people: columns, sizes, times.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

class VTextTable
{
public:
  explicit VTextTable( std::vector<std::string> i_Heads );
  // At most as many cells as there are heads.
  void AddRow( std::vector<std::string> i_Cells );
  // Columns padded to their widest cell, two spaces between them, a line each.
  std::string ToText() const;

private:
  std::vector<std::vector<std::string>> m_Rows;
};

// A text as part of a line: blanks in the place of what would end the line or move the cursor.
std::string OneLine( std::string i_Text );
// At most so many characters, with dots where some are missing.
std::string Shortened( const std::string& i_rText, size_t i_Characters );

std::string JoinTexts( const std::vector<std::string>& i_rTexts, const std::string& i_rBetween );

// "412.3 MB": powers of ten, one decimal.
std::string BytesToText( uint64_t i_Bytes );

// A file written with plain system calls: what every recording costs at least. Removed again.
#pragma once

#include <cstddef>
#include <string>

class VPlainFile
{
public:
  // Throws std::runtime_error where it cannot be made.
  explicit VPlainFile( std::string i_Path );
  // Removes the file.
  ~VPlainFile();
  VPlainFile( const VPlainFile& ) = delete;
  VPlainFile& operator=( const VPlainFile& ) = delete;

  // Throws std::runtime_error where not all could be written.
  void Write( const void* i_pData, size_t i_Size );
  void Close();

private:
  const std::string m_Path;
  int m_Handle;
};

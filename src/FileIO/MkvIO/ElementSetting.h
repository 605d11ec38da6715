// Values in the libraries' element trees.
#pragma once

#include <ebml/EbmlMaster.h>

namespace MkvIO
{

// Sets a child of a master, which is made if it is missing, and has it written also where the value is the element's default.
template<class TElement, class TValue>
void Set( libebml::EbmlMaster& io_rMaster, const TValue& i_rValue )
{
  auto& rElement = libebml::GetChild<TElement>( io_rMaster );
  rElement.SetValue( i_rValue );
  rElement.ForceNoDefault();
}

}

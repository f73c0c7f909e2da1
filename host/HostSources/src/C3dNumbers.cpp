#include "C3dNumbers.h"

namespace HostSources::C3d
{
namespace
{
template < EForm Form >
void LoadFloats( const std::byte* i_pBytes, std::size_t i_Count, float* o_pWords )
{
  for ( std::size_t Index = 0; Index < i_Count; ++Index )
  {
    o_pWords[Index] = LoadFloat< Form >( i_pBytes + 4 * Index );
  }
}

template < EForm Form >
void LoadIntegers( const std::byte* i_pBytes, std::size_t i_Count, float* o_pWords )
{
  for ( std::size_t Index = 0; Index < i_Count; ++Index )
  {
    o_pWords[Index] = static_cast< std::int16_t >( LoadU16< Form >( i_pBytes + 2 * Index ) );
  }
}
} // namespace

void LoadWords( EForm i_Form, bool i_bFloat, const std::byte* i_pBytes, std::size_t i_Count, float* o_pWords )
{
  if ( !i_bFloat )
  {
    i_Form == EForm::Mips ? LoadIntegers< EForm::Mips >( i_pBytes, i_Count, o_pWords )
                          : LoadIntegers< EForm::Intel >( i_pBytes, i_Count, o_pWords );
    return;
  }
  switch ( i_Form )
  {
  case EForm::Dec:
    return LoadFloats< EForm::Dec >( i_pBytes, i_Count, o_pWords );
  case EForm::Mips:
    return LoadFloats< EForm::Mips >( i_pBytes, i_Count, o_pWords );
  case EForm::Intel:
    std::memcpy( o_pWords, i_pBytes, 4 * i_Count );
    return;
  }
}

} // namespace HostSources::C3d

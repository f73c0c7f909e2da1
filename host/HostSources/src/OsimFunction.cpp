#include "OsimFunction.h"

#include "ReaderSupport.h"

#include <algorithm>
#include <cmath>

namespace HostSources::Osim
{
namespace
{
constexpr std::string_view Multiplier = "MultiplierFunction";
constexpr std::string_view Known[] = {
    "Constant",           "LinearFunction", "SimmSpline", "NaturalCubicSpline", "PiecewiseLinearFunction",
    "PolynomialFunction", Multiplier };

std::vector< double > NumbersIn( Xml::VNode i_pElement, std::string_view i_Child, const std::string& i_rWhat )
{
  return Xml::Numbers( Xml::Text( Xml::Child( i_pElement, i_Child ) ), i_rWhat );
}
} // namespace

Xml::VNode VFunction::FindIn( Xml::VNode i_pOwner, std::string_view i_Wrapper )
{
  if ( const Xml::VNode pWrapper = Xml::Child( i_pOwner, i_Wrapper ) )
  {
    return Xml::FirstChild( pWrapper );
  }
  for ( Xml::VNode pChild = Xml::FirstChild( i_pOwner ); pChild; pChild = Xml::Next( pChild ) )
  {
    const std::string_view Name = Xml::Name( pChild );
    if ( std::find( std::begin( Known ), std::end( Known ), Name ) != std::end( Known ) ||
         Xml::Attribute( pChild, "name" ) == "function" )
    {
      return pChild;
    }
  }
  return nullptr;
}

VFunction VFunction::Identity()
{
  VFunction Function;
  Function.m_Kind = EKind::Linear;
  Function.m_Coefficients = { 1, 0 };
  return Function;
}

VFunction VFunction::Read( Xml::VNode i_pElement, std::size_t i_Arguments, const std::string& i_rOwner )
{
  const std::string Name( Xml::Name( i_pElement ) ), What = std::string( Name ).append( " of " ).append( i_rOwner );
  VFunction Function;
  if ( Name == Multiplier )
  {
    const auto Scale = NumbersIn( i_pElement, "scale", What );
    const Xml::VNode pInner = FindIn( i_pElement, "function" );
    if ( Scale.size() > 1 || pInner == nullptr )
    {
      throw VReadFault( "expected a function and one scale for " + What );
    }
    Function = Read( pInner, i_Arguments, i_rOwner );
    Function.m_Scale *= Scale.empty() ? 1 : Scale[0];
    return Function;
  }
  if ( Name == "SimmSpline" || Name == "NaturalCubicSpline" || Name == "PiecewiseLinearFunction" )
  {
    Function.TakePieces( i_pElement, Name != "PiecewiseLinearFunction", What );
  }
  else if ( Name == "Constant" || Name == "LinearFunction" || Name == "PolynomialFunction" )
  {
    Function.m_Kind = Name == "Constant"         ? EKind::Constant
                      : Name == "LinearFunction" ? EKind::Linear
                                                 : EKind::Polynomial;
    Function.m_Coefficients = NumbersIn( i_pElement, Function.IsConstant() ? "value" : "coefficients", What );
    const std::size_t Count = Function.m_Coefficients.size();
    if ( Function.IsConstant() ? Count != 1 : Function.IsLinear() ? Count != i_Arguments + 1 : Count == 0 )
    {
      throw VReadFault( std::string( "expected as many numbers as a " )
                            .append( What )
                            .append( " needs, found " )
                            .append( std::to_string( Count ) ) );
    }
  }
  else
  {
    throw VReadFault(
        std::string( "expected a constant, a linear or piecewise linear function, a polynomial or a cubic "
                     "spline for " )
            .append( i_rOwner )
            .append( ", found \"" )
            .append( ToUtf8( Name.substr( 0, 40 ) ) )
            .append( "\"" ),
        ZEK::IResult::NotSupported );
  }
  if ( i_Arguments != 1 && ( Function.m_Kind == EKind::Polynomial || Function.m_Kind == EKind::Pieces ) )
  {
    throw VReadFault( "expected one coordinate for " + What + ", found " + std::to_string( i_Arguments ) );
  }
  return Function;
}

void VFunction::TakePieces( Xml::VNode i_pElement, bool i_bSmooth, const std::string& i_rWhat )
{
  m_Kind = EKind::Pieces;
  m_Places = NumbersIn( i_pElement, "x", i_rWhat );
  m_Values = NumbersIn( i_pElement, "y", i_rWhat );
  const std::size_t Count = m_Places.size();
  const auto NotAfter = []( double i_A, double i_B )
  {
    return !( i_B > i_A );
  };
  if ( Count < 2 || m_Values.size() != Count ||
       std::adjacent_find( m_Places.begin(), m_Places.end(), NotAfter ) != m_Places.end() )
  {
    throw VReadFault( "expected two or more ascending x and as many y for " + i_rWhat );
  }
  m_Slopes.resize( Count );
  m_Squares.resize( Count );
  m_Cubes.resize( Count );
  for ( std::size_t Index = 0; Index + 1 < Count; ++Index )
  {
    m_Slopes[Index] = ( m_Values[Index + 1] - m_Values[Index] ) / ( m_Places[Index + 1] - m_Places[Index] );
  }
  m_Slopes[Count - 1] = m_Slopes[Count - 2];
  if ( i_bSmooth && Count > 2 )
  {
    Smoothe();
  }
}

/// A cubic spline whose third derivative at either end is that of the cubic through the four points there.
void VFunction::Smoothe()
{
  const std::size_t Count = m_Places.size(), Last = Count - 1;
  std::vector< double > Width( Count ), Diagonal( Count ), C( Count );
  for ( std::size_t Index = 0; Index < Last; ++Index )
  {
    Width[Index] = m_Places[Index + 1] - m_Places[Index];
  }
  for ( std::size_t Index = 1; Index < Last; ++Index )
  {
    Diagonal[Index] = 2 * ( Width[Index - 1] + Width[Index] );
    C[Index] = m_Slopes[Index] - m_Slopes[Index - 1];
  }
  Diagonal[0] = -Width[0];
  Diagonal[Last] = -Width[Last - 1];
  if ( Count > 3 )
  {
    C[0] = ( C[2] / ( m_Places[3] - m_Places[1] ) - C[1] / ( m_Places[2] - m_Places[0] ) ) * Width[0] * Width[0] /
           ( m_Places[3] - m_Places[0] );
    C[Last] = -( C[Last - 1] / ( m_Places[Last] - m_Places[Last - 2] ) -
                 C[Last - 2] / ( m_Places[Last - 1] - m_Places[Last - 3] ) ) *
              Width[Last - 1] * Width[Last - 1] / ( m_Places[Last] - m_Places[Last - 3] );
  }
  for ( std::size_t Index = 1; Index < Count; ++Index )
  {
    const double Factor = Width[Index - 1] / Diagonal[Index - 1];
    Diagonal[Index] -= Factor * Width[Index - 1];
    C[Index] -= Factor * C[Index - 1];
  }
  C[Last] /= Diagonal[Last];
  for ( std::size_t Index = Last; Index-- > 0; )
  {
    C[Index] = ( C[Index] - Width[Index] * C[Index + 1] ) / Diagonal[Index];
  }
  m_Slopes[Last] += Width[Last - 1] * ( C[Last - 1] + 2 * C[Last] );
  for ( std::size_t Index = 0; Index < Last; ++Index )
  {
    m_Slopes[Index] -= Width[Index] * ( C[Index + 1] + 2 * C[Index] );
    m_Cubes[Index] = ( C[Index + 1] - C[Index] ) / Width[Index];
    m_Squares[Index] = 3 * C[Index];
  }
}

double VFunction::Value( std::span< const double > i_Arguments ) const
{
  double Result = 0;
  if ( m_Kind == EKind::Constant )
  {
    Result = m_Coefficients[0];
  }
  else if ( m_Kind == EKind::Linear )
  {
    Result = m_Coefficients.back();
    for ( std::size_t Index = 0; Index < i_Arguments.size(); ++Index )
    {
      Result += m_Coefficients[Index] * i_Arguments[Index];
    }
  }
  else if ( m_Kind == EKind::Polynomial )
  {
    for ( const double Coefficient : m_Coefficients )
    {
      Result = Result * i_Arguments[0] + Coefficient;
    }
  }
  else
  {
    const double At = i_Arguments[0];
    const auto Above = std::upper_bound( m_Places.begin(), m_Places.end(), At );
    const auto Piece = static_cast< std::size_t >( std::max< std::ptrdiff_t >( Above - m_Places.begin() - 1, 0 ) );
    const double Way = At - m_Places[Piece];
    // Before its first place a piece has no curve; the last place has none either.
    Result = m_Values[Piece] +
             Way * ( m_Slopes[Piece] + ( Way < 0 ? 0 : Way * ( m_Squares[Piece] + Way * m_Cubes[Piece] ) ) );
  }
  return m_Scale * Result;
}

} // namespace HostSources::Osim

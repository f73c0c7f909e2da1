#pragma once

#include "XmlTree.h"

#include <cstdint>
#include <span>
#include <vector>

namespace HostSources::Osim
{

/// How a number of a model follows from its coordinates.
class VFunction
{
public:
  /// Of the element that holds the numbers, such as LinearFunction; throws `VReadFault`. `i_rOwner` is named in
  /// messages, `i_Arguments` are the coordinates that it gets.
  static VFunction Read( Xml::VNode i_pElement, std::size_t i_Arguments, const std::string& i_rOwner );
  /// The element of a function among the children of `i_pOwner`, or in a child named `i_Wrapper`; null without one.
  static Xml::VNode FindIn( Xml::VNode i_pOwner, std::string_view i_Wrapper );
  static VFunction Identity();

  double Value( std::span< const double > i_Arguments ) const;
  bool IsConstant() const { return m_Kind == EKind::Constant; }
  bool IsLinear() const { return m_Kind == EKind::Linear; }

private:
  enum class EKind : std::uint8_t
  {
    Constant,
    Linear,
    Polynomial,
    Pieces
  };
  void TakePieces( Xml::VNode i_pElement, bool i_bSmooth, const std::string& i_rWhat );
  void Smoothe();

  EKind m_Kind = EKind::Constant;
  double m_Scale = 1;
  /// Constant: the value. Linear: a slope an argument, then the value at zero. Polynomial: highest power first.
  std::vector< double > m_Coefficients{ 0 };
  /// Of pieces: the places, the values there, and what each piece adds: times the way from its place, its square and
  /// its cube. Before the first and behind the last place it goes on straight.
  std::vector< double > m_Places, m_Values, m_Slopes, m_Squares, m_Cubes;
};

} // namespace HostSources::Osim

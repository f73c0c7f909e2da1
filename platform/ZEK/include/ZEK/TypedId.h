#pragma once

#include <compare>
#include <cstdint>

namespace ZEK
{

struct IChangeIdTag
{
};

struct IInvalidIdValueZero
{
  static constexpr std::uint64_t Value = 0;
};

/// A number that identifies something. `TTag` keeps ids of different things apart; `TInvalid::Value` names nothing.
template < typename T, typename TTag, typename TInvalid >
class ITypedId
{
public:
  constexpr ITypedId() = default;
  constexpr explicit ITypedId( T i_Value )
    : m_Value( i_Value )
  {
  }

  constexpr T Value() const { return m_Value; }
  constexpr bool IsValid() const { return m_Value != static_cast< T >( TInvalid::Value ); }
  friend constexpr auto operator<=>( ITypedId i_A, ITypedId i_B ) = default;

private:
  T m_Value = static_cast< T >( TInvalid::Value );
};

/// The number of a commit of a store; 0 is no commit.
using ChangeId = ITypedId< std::uint64_t, IChangeIdTag, IInvalidIdValueZero >;

} // namespace ZEK

#pragma once

#include <memory>
#include <utility>

namespace ZEK
{

/// Base of objects that hand out weak references to themselves in a step after construction.
class VShared : public std::enable_shared_from_this< VShared >
{
public:
  virtual ~VShared() = default;
  VShared( const VShared& ) = delete;
  VShared& operator=( const VShared& ) = delete;

  /// Run once by `MakeShared`, when the object can hand out references; connections are made here.
  virtual void Start() {}

protected:
  VShared() = default;

  template < typename T >
  static std::weak_ptr< T > Weak( T* i_pSelf )
  {
    return std::static_pointer_cast< T >( i_pSelf->VShared::shared_from_this() );
  }
};

template < typename T, typename... TArguments >
std::shared_ptr< T > MakeShared( TArguments&&... i_rArguments )
{
  auto pObject = std::make_shared< T >( std::forward< TArguments >( i_rArguments )... );
  pObject->Start();
  return pObject;
}

} // namespace ZEK

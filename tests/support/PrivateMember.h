// Access to a private member, for rules without another observable effect. In the global namespace:
//
//     struct Size : PrivateMember<std::size_t List::*> {
//         friend Type memberOf(Size);
//     };
//     template struct Reveal<Size, &List::fSize>;
//     ... list.*memberOf(Size()) ...
#pragma once

template <typename Member>
struct PrivateMember {
    using Type = Member;
};

template <typename Tag, typename Tag::Type kMember>
struct Reveal {
    friend typename Tag::Type memberOf(Tag) { return kMember; }
};

#ifndef TESTS_SUPPORT_PRIVATEMEMBER_H
#define TESTS_SUPPORT_PRIVATEMEMBER_H

namespace support {

// Lets a test look at a private member that nothing public shows. A tag of this
// namespace names the member's type and declares the function that finds it; the
// explicit instantiation, where access is not checked, defines that function:
//
//     namespace support {
//     struct UploadFiles {
//         typedef Json::Value TALO::WebEntry::*Type;
//         friend Type Find(UploadFiles);
//     };
//     template struct PrivateMember<UploadFiles, &TALO::WebEntry::uploadFiles>;
//     }
//     entry.*Find(support::UploadFiles())
template <typename Tag, typename Tag::Type member>
struct PrivateMember {
    friend typename Tag::Type Find(Tag) {
        return member;
    }
};

}  // namespace support

#endif

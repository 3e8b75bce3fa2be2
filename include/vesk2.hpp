// SPDX-License-Identifier: Apache-2.0
// vesk2.hpp: everything that libvesk2 exports, the flat functions and the classes of ZvVesk2.
//
// The classes, each under the one that it derives from:
//
//   DExpression              a counted value                                    expression.h
//     ByteString             bytes, with a display hint
//       TimeStamp            a moment as text                                   time_stamp.h
//     SExpression            a list of values, which may have a file            expression.h
//       Subject              whom authority is granted to                       subject.h
//         Principal          a subject that can sign
//           PublicKey        an RSA or DSA key                                  public_key.h
//           Hash             the digest of a key, or of what was signed         hash.h
//         ThresholdSubject   k of n keys together                               subject.h
//         Name               a name; never read from text
//       Cert                 an issuer grants a subject what a tag says         cert.h
//       Signature            what was signed, by whom, and how                  signature.h
//       CertSequence         the chain that a requester presents                cert_sequence.h
//         CertRequest        the same in a file of its own kind
//       AclEntry             what this machine grants to whom                   acl_entry.h
//       Crl, CrlSequence     a revocation list, and the form that travels       crl.h
//   Manifest                 a signed list of a directory tree, and its proof   manifest.h
//   BodyObject               an entry of that list: BodyFile, BodyDirectory     manifest_body.h
//   ManifestWriter           makes one, up to the signatures                    manifest_writer.h
//   Evidence                 what a verification read and found                 evidence.h
//   Explanation              why its answer is what it is                       explanation.h
//
// and beside them Ref, which owns a reference (ref.h), ZvBuffer, from which everything is read, and
// crypto keys (platform.h), PointerArray (pointer_array.h), the two reductions (verify.h), the
// store roots and the texts of codes (context.h), the texts that people are shown (wording.h), and
// every limit (limits.h).
//
// To read them in order: expression.h (values, who owns them, how they are written), subject.h,
// hash.h and public_key.h (who), cert.h and signature.h (one grant), cert_sequence.h with
// acl_entry.h (a chain, and what it must end at), crl.h (what takes it back), manifest.h (what all
// of it is for), evidence.h (why an answer is what it is).
//
// What holds in all of them:
//   - A function that can fail returns an int, of the codes of vesk2.h: 0 is success, and every
//     other answer of a verification a refusal. No exception leaves the library.
//   - What is said to be shared, taken over or adopted is so in the sense of expression.h. Getters
//     return borrowed pointers, outputs through reference arguments are the caller's, and must be
//     null before where that is said.
//   - Objects belong to one thread, and so do those that share a value. Separate objects on
//     separate threads need no care; keys may be verified with by several at once.
//   - After a failed Import or Set an object is partly built: free it. It is never taken for
//     another one, as its fields are set to what its list holds.
//   - A text that a stranger chose stays one: Wording makes it safe to be shown.
//
// What a program may rely on are the functions, static or not, and the virtual slots of these
// classes. What an object holds and how it is laid out is nobody's to know: values are made with
// new, which asks the library, and freed with Free. Of what may lie in a program's own memory
// (Manifest, ManifestWriter, Evidence, Explanation, the body classes, PointerArray, Ref, Iterator)
// the size stays as well. No class is to be derived from.
#ifndef VESK2_HPP
#define VESK2_HPP

#include <vesk2.h>
#include <vesk2/acl_entry.h>
#include <vesk2/cert.h>
#include <vesk2/cert_sequence.h>
#include <vesk2/context.h>
#include <vesk2/crl.h>
#include <vesk2/evidence.h>
#include <vesk2/explanation.h>
#include <vesk2/expression.h>
#include <vesk2/file_item.h>
#include <vesk2/hash.h>
#include <vesk2/limits.h>
#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>
#include <vesk2/manifest_writer.h>
#include <vesk2/platform.h>
#include <vesk2/pointer_array.h>
#include <vesk2/public_key.h>
#include <vesk2/ref.h>
#include <vesk2/signature.h>
#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>
#include <vesk2/verify.h>
#include <vesk2/wording.h>

#endif  // VESK2_HPP

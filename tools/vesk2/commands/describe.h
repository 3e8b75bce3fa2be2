// SPDX-License-Identifier: Apache-2.0
// describe.h: what each kind of object says, as a sheet: what `show` and the `show` of every noun
// print, and their members for machines.
//
// The members are those of shapes.h.
#ifndef VESK2_TOOLS_DESCRIBE_H
#define VESK2_TOOLS_DESCRIBE_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/sheet.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

Sheet DescribeKey(PublicKey& key);
// A digest, or the members of a k-of-n.
Sheet DescribeSubject(ZvVesk2::Subject& subject);
// `file` is the name of the entry's file; empty for one that is in no store.
Sheet DescribeEntry(ZvVesk2::AclEntry& entry, const std::string& file = "");
// A certificate, its signature checked unless there is none.
Sheet DescribeCert(ZvVesk2::Cert& cert, ZvVesk2::Signature* signature);
// A signature whose object is not at hand.
Sheet DescribeSignature(ZvVesk2::Signature& signature);
// A chain, or the request of a key for itself.
Sheet DescribeChain(const std::vector<ChainLink>& links);
// A bare list, and one with the certificate and the signature that vouch for it.
Sheet DescribeCrl(const ZvVesk2::Crl& list);
Sheet DescribeCrl(CrlSequence& list);

// A manifest, `code` being what its signatures and its digest are worth.
Sheet DescribeManifest(const SignatureBlock& block, int code);

// Adds the row and the member "signature" for a checked signature's code.
void AddSignature(Sheet& sheet, int code);

// Says the rows and hands the members to machines.
void Present(const Sheet& sheet);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_DESCRIBE_H

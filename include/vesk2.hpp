// vesk2.hpp: everything that libvesk2 exports, the flat functions and the classes of ZvVesk2.
#ifndef VESK2_HPP
#define VESK2_HPP

#include <vesk2.h>
#include <vesk2/acl_entry.h>
#include <vesk2/cert.h>
#include <vesk2/cert_sequence.h>
#include <vesk2/context.h>
#include <vesk2/crl.h>
#include <vesk2/evidence.h>
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

#endif  // VESK2_HPP

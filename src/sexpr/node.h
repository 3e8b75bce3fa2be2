// The elements of a list, linked both ways.
#ifndef VESK2_SRC_SEXPR_NODE_H
#define VESK2_SRC_SEXPR_NODE_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

class SExpression::Node {
 public:
  Node* next = nullptr;
  Node* prev = nullptr;
  DExpression* value = nullptr;  // the list holds one reference
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_NODE_H

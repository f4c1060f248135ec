#pragma once

namespace vx7diag {

// One kind of thing that can be watched on a line. Aspect objects stand for their kind: subjects
// key their observer sets on the object's address, so one object of each kind serves everyone.
class Aspect {
  public:
    Aspect() = default;
    Aspect(const Aspect&) = delete;
    Aspect& operator=(const Aspect&) = delete;
    virtual ~Aspect();

    // Same dynamic type; fields are not compared.
    virtual bool operator==(const Aspect& other) const;
    virtual bool operator<(const Aspect& other) const;
    // Text of the aspect for trace and display; null when the aspect has none.
    virtual char* ToZLG();

  protected:
    char* zlgText = nullptr;
};

}  // namespace vx7diag

"""What configuration B did to one session against A: energy and saturated time per domain,
and the warnings about what was left applied that only B's replay gave."""


def _warning_key(warning):
    call = warning.get("call") or {}
    return (warning.get("kind", ""), warning.get("message", ""), call.get("where", ""))


class SessionDelta:
    def __init__(self, result):
        self.session = result["session"]
        a, b = result["a"], result["b"]
        self.energy = {}  # domain id -> (delta mJ, delta saturated ms)
        energy_a, energy_b = a.get("energy", {}), b.get("energy", {})
        for domain in sorted(set(energy_a) | set(energy_b)):
            fa, fb = energy_a.get(domain, {}), energy_b.get(domain, {})
            self.energy[domain] = (fb.get("mJ", 0.0) - fa.get("mJ", 0.0),
                                   fb.get("saturated_ms", 0.0) - fa.get("saturated_ms", 0.0))
        seen = {_warning_key(w) for w in a.get("warnings", [])}
        self.new_warnings = [w for w in b.get("warnings", []) if _warning_key(w) not in seen]

    def energy_mj(self):
        return sum(mj for mj, _ in self.energy.values())

    def saturated_ms(self):
        return sum(ms for _, ms in self.energy.values())

    def regression(self):
        """Sort key, worst first: more energy, then more saturated time, then more warnings."""
        return (-self.energy_mj(), -self.saturated_ms(), -len(self.new_warnings), self.session)

    @staticmethod
    def of(results):
        """The deltas of the sessions that ran under both configurations."""
        return [SessionDelta(r) for r in results
                if r["status"] == "ok" and r.get("a") is not None and r.get("b") is not None]
